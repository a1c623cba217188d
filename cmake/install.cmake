# What `cmake --install` puts where, and how other projects find it: find_package(omxbridge) and pkg-config.
include(GNUInstallDirs)
include(CMakePackageConfigHelpers)

set_target_properties(omxbridge PROPERTIES INSTALL_RPATH "$ORIGIN")
install(TARGETS omxbridge EXPORT omxbridge
  LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR}
  INCLUDES DESTINATION ${CMAKE_INSTALL_INCLUDEDIR})
install(DIRECTORY include/omxbridge DESTINATION ${CMAKE_INSTALL_INCLUDEDIR})
if(TARGET omxhost)
  set_target_properties(omxhost omxmediaserver PROPERTIES INSTALL_RPATH "$ORIGIN")
  # The platform's port: linked by the library, and of use to tests of applications.
  install(TARGETS omxhost EXPORT omxbridge
    LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR}
    INCLUDES DESTINATION ${CMAKE_INSTALL_INCLUDEDIR})
  install(DIRECTORY host/include/omxhost DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}
    PATTERN services.h EXCLUDE)
  # Loaded at run time by the platform's port, which looks beside itself.
  install(TARGETS omxmediaserver LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR})
endif()

set(package_directory ${CMAKE_INSTALL_LIBDIR}/cmake/omxbridge)
install(EXPORT omxbridge NAMESPACE omxbridge:: FILE omxbridge-targets.cmake DESTINATION ${package_directory})
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
  DESTINATION ${package_directory})

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
install(FILES ${CMAKE_BINARY_DIR}/omxbridge.pc DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
