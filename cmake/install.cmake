# What `cmake --install` puts where, and how other projects find it: find_package(omxbridge) and pkg-config.
# The components are those of the packages (packages.cmake).
if(EXISTS /etc/debian_version AND CMAKE_LIBRARY_ARCHITECTURE)
  # Debian's place for libraries below any prefix, not below /usr alone: one build is then good for both.
  set(CMAKE_INSTALL_LIBDIR lib/${CMAKE_LIBRARY_ARCHITECTURE} CACHE PATH "Libraries, below the prefix")
endif()
include(GNUInstallDirs)
include(CMakePackageConfigHelpers)

# What of these there is depends on the platform: a device brings its own port, and no tool.
set(installed_libraries omxbridge)
if(TARGET omxhost)
  list(APPEND installed_libraries omxhost)
  set_target_properties(omxhost omxmediaserver PROPERTIES INSTALL_RPATH "$ORIGIN")
endif()
set_target_properties(omxbridge PROPERTIES INSTALL_RPATH "$ORIGIN")

# The library, and the platform's port, which it links and which is of use to tests of applications.
install(TARGETS ${installed_libraries} EXPORT omxbridge
  LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR} COMPONENT library NAMELINK_COMPONENT development
  INCLUDES DESTINATION ${CMAKE_INSTALL_INCLUDEDIR})
install(DIRECTORY include/omxbridge DESTINATION ${CMAKE_INSTALL_INCLUDEDIR} COMPONENT development)
install(DIRECTORY docs/ DESTINATION ${CMAKE_INSTALL_DATADIR}/doc/libomxbridge-dev COMPONENT development
  PATTERN reference EXCLUDE)
install(DIRECTORY examples DESTINATION ${CMAKE_INSTALL_DATADIR}/doc/libomxbridge-dev COMPONENT development
  USE_SOURCE_PERMISSIONS)
if(TARGET omxhost)
  install(DIRECTORY host/include/omxhost DESTINATION ${CMAKE_INSTALL_INCLUDEDIR} COMPONENT development
    PATTERN services.h EXCLUDE)
  # Loaded at run time by the platform's port, which looks beside itself.
  install(TARGETS omxmediaserver LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR} COMPONENT mediaserver)
endif()

# The tool, which writes its own manual page and completions.
if(TARGET omxbridge_tool)
  set_target_properties(omxbridge_tool PROPERTIES INSTALL_RPATH "$ORIGIN/../${CMAKE_INSTALL_LIBDIR}")
  install(TARGETS omxbridge_tool RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR} COMPONENT tool)
  set(written ${CMAKE_BINARY_DIR}/tools/omxbridge.1.gz ${CMAKE_BINARY_DIR}/tools/omxbridge
    ${CMAKE_BINARY_DIR}/tools/_omxbridge)
  add_custom_command(OUTPUT ${written} WORKING_DIRECTORY ${CMAKE_BINARY_DIR}/tools VERBATIM
    COMMAND omxbridge_tool manual > omxbridge.1
    COMMAND gzip -9nf omxbridge.1
    COMMAND omxbridge_tool completion bash > omxbridge
    COMMAND omxbridge_tool completion zsh > _omxbridge)
  add_custom_target(omxbridge_tool_writings ALL DEPENDS ${written})
  set(directories man/man1 bash-completion/completions zsh/site-functions)
  foreach(writing directory IN ZIP_LISTS written directories)
    install(FILES ${writing} DESTINATION ${CMAKE_INSTALL_DATADIR}/${directory} COMPONENT tool)
  endforeach()
endif()

set(package_directory ${CMAKE_INSTALL_LIBDIR}/cmake/omxbridge)
install(EXPORT omxbridge NAMESPACE omxbridge:: FILE omxbridge-targets.cmake DESTINATION ${package_directory}
  COMPONENT development)
file(CONFIGURE OUTPUT ${CMAKE_BINARY_DIR}/omxbridge-config.cmake @ONLY CONTENT [[
include("${CMAKE_CURRENT_LIST_DIR}/omxbridge-targets.cmake")
# The frame functions are in the same library.
if(NOT TARGET omxbridge::frames)
  add_library(omxbridge::frames INTERFACE IMPORTED)
  target_link_libraries(omxbridge::frames INTERFACE omxbridge::omxbridge)
endif()
]])
write_basic_package_version_file(${CMAKE_BINARY_DIR}/omxbridge-config-version.cmake
  COMPATIBILITY SameMajorVersion)
install(FILES ${CMAKE_BINARY_DIR}/omxbridge-config.cmake ${CMAKE_BINARY_DIR}/omxbridge-config-version.cmake
  DESTINATION ${package_directory} COMPONENT development)

# Relative to the file, so that the tree can be moved.
file(RELATIVE_PATH prefix_from_pc /${CMAKE_INSTALL_LIBDIR}/pkgconfig /)
file(CONFIGURE OUTPUT ${CMAKE_BINARY_DIR}/omxbridge.pc @ONLY CONTENT [[
prefix=${pcfiledir}/@prefix_from_pc@
includedir=${prefix}/@CMAKE_INSTALL_INCLUDEDIR@
libdir=${prefix}/@CMAKE_INSTALL_LIBDIR@

Name: omxbridge
Description: Video calls through the device's H.264 encoder and decoder; raw video frames
Version: @PROJECT_VERSION@
Libs: -L${libdir} -lomxbridge
Cflags: -I${includedir}
]])
install(FILES ${CMAKE_BINARY_DIR}/omxbridge.pc DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig COMPONENT development)
