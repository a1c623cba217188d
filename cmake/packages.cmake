# The Debian packages that scripts/package makes of a build, one a component of install.cmake.
set(CPACK_GENERATOR DEB)
set(CPACK_PACKAGE_NAME omxbridge)
set(CPACK_PACKAGE_VERSION ${PROJECT_VERSION})
set(CPACK_PACKAGING_INSTALL_PREFIX /usr)
set(CPACK_STRIP_FILES ON)
set(CPACK_DEB_COMPONENT_INSTALL ON)
set(CPACK_COMPONENTS_GROUPING IGNORE)
set(CPACK_COMPONENTS_ALL library mediaserver tool development)
set(CPACK_DEBIAN_FILE_NAME DEB-DEFAULT)
set(CPACK_DEBIAN_PACKAGE_MAINTAINER "omxbridge developers")
set(CPACK_DEBIAN_PACKAGE_CONTROL_STRICT_PERMISSION ON)
# What the files link to outside of this project is found out, and what programs that link to the library depend on
# is told. Among each other the packages are of one build.
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS ON)
set(CPACK_DEBIAN_PACKAGE_SHLIBDEPS_PRIVATE_DIRS ${CMAKE_LIBRARY_OUTPUT_DIRECTORY})
set(CPACK_DEBIAN_PACKAGE_GENERATE_SHLIBS ON)
set(CPACK_DEBIAN_PACKAGE_GENERATE_SHLIBS_POLICY ">=")
set(same_build "(= ${PROJECT_VERSION})")

set(CPACK_DEBIAN_LIBRARY_PACKAGE_NAME libomxbridge1)
set(CPACK_DEBIAN_LIBRARY_PACKAGE_SECTION libs)
set(CPACK_DEBIAN_LIBRARY_PACKAGE_RECOMMENDS omxbridge-mediaserver)
set(CPACK_COMPONENT_LIBRARY_DESCRIPTION "H.264 sessions for video calls, on OpenMAX IL components
The library between a video-calling application and a device's H.264
encoder and decoder, and functions for raw video frames. With it comes the
port of the platform to plain Linux that it runs on.")

set(CPACK_DEBIAN_MEDIASERVER_PACKAGE_NAME omxbridge-mediaserver)
set(CPACK_DEBIAN_MEDIASERVER_PACKAGE_SECTION video)
set(CPACK_DEBIAN_MEDIASERVER_PACKAGE_DEPENDS "libomxbridge1 ${same_build}")
set(CPACK_COMPONENT_MEDIASERVER_DESCRIPTION "media server of omxbridge for plain Linux
The OpenMAX IL components of several device generations, emulated with
libavcodec. The library loads it when a session is created; without it there
are no components.")

set(CPACK_DEBIAN_TOOL_PACKAGE_NAME omxbridge)
set(CPACK_DEBIAN_TOOL_PACKAGE_SECTION video)
set(CPACK_DEBIAN_TOOL_PACKAGE_DEPENDS "libomxbridge1 ${same_build}, omxbridge-mediaserver ${same_build}")
set(CPACK_COMPONENT_TOOL_DESCRIPTION "video calls from the command line through a device's H.264 codecs
Encodes and decodes video through the components of a device, or a whole
call with both and a report; converts and compares pictures.")

set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_NAME libomxbridge-dev)
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_SECTION libdevel)
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_DEPENDS "libomxbridge1 ${same_build}")
set(CPACK_DEBIAN_DEVELOPMENT_PACKAGE_RECOMMENDS omxbridge-mediaserver)
set(CPACK_COMPONENT_DEVELOPMENT_DESCRIPTION "H.264 sessions for video calls: headers, guides, examples
What it takes to build applications with omxbridge, by CMake or pkg-config:
headers, guides, and programs to start from.")

# Debian wants one in every package.
foreach(component IN LISTS CPACK_COMPONENTS_ALL)
  string(TOUPPER ${component} name)
  install(FILES LICENSE DESTINATION ${CMAKE_INSTALL_DATADIR}/doc/${CPACK_DEBIAN_${name}_PACKAGE_NAME}
    RENAME copyright COMPONENT ${component})
endforeach()

include(CPack)
