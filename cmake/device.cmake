# The platform of a device: headers of its source tree, and the libraries that were built of it.
set(OMXBRIDGE_DEVICE_TREE "" CACHE PATH "The device tree")
set(OMXBRIDGE_DEVICE_INCLUDE_DIRS
  frameworks/base/include
  frameworks/base/include/media/stagefright/openmax
  frameworks/base/native/include
  system/core/include
  hardware/libhardware/include
  dalvik/libnativehelper/include/nativehelper
  CACHE STRING "Folders with the platform's headers, in the tree or absolute")
set(OMXBRIDGE_DEVICE_LIBRARY_DIR "" CACHE PATH "The folder of the platform's built libraries")
set(OMXBRIDGE_DEVICE_LIBRARIES stagefright media binder utils cutils log
  CACHE STRING "The platform's libraries, by name or path")
set(OMXBRIDGE_DEVICE_OPTIONS "" CACHE STRING "Compiler options that the platform's headers want")

if(NOT IS_DIRECTORY "${OMXBRIDGE_DEVICE_TREE}")
  message(FATAL_ERROR "A device build needs the device tree: -DOMXBRIDGE_DEVICE_TREE=FOLDER")
endif()

# The platform's headers from before C++11 define types of their own named char16_t and char32_t, which have been
# keywords since. A header of the same name in front of each defines the names away while it is read. Nothing of
# the standard library may be read meanwhile for the first time.
set(forwarding ${CMAKE_BINARY_DIR}/device/include)
foreach(header IN ITEMS
    binder/IMemory.h binder/IServiceManager.h binder/MemoryDealer.h binder/ProcessState.h
    media/IMediaPlayerService.h media/IOMX.h media/stagefright/ColorConverter.h
    utils/Errors.h utils/List.h utils/RefBase.h utils/String16.h utils/Vector.h)
  file(CONFIGURE OUTPUT ${forwarding}/${header} @ONLY CONTENT [[
#include <stdint.h>
#include <atomic>
#include <functional>
#include <limits>
#include <memory>
#include <string>
#pragma push_macro("char16_t")
#pragma push_macro("char32_t")
#undef char16_t
#undef char32_t
#define char16_t uint16_t
#define char32_t uint32_t
#include_next <@header@>
#pragma pop_macro("char16_t")
#pragma pop_macro("char32_t")
]])
endforeach()

set(folders ${forwarding})
foreach(folder IN LISTS OMXBRIDGE_DEVICE_INCLUDE_DIRS)
  cmake_path(ABSOLUTE_PATH folder BASE_DIRECTORY ${OMXBRIDGE_DEVICE_TREE})
  list(APPEND folders ${folder})
endforeach()
target_include_directories(omxbridge_platform SYSTEM INTERFACE ${folders})
target_compile_options(omxbridge_platform INTERFACE ${OMXBRIDGE_DEVICE_OPTIONS})
target_link_directories(omxbridge_platform INTERFACE ${OMXBRIDGE_DEVICE_LIBRARY_DIR})
target_link_libraries(omxbridge_platform INTERFACE ${OMXBRIDGE_DEVICE_LIBRARIES})
