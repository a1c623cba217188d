# cmake -DPROJECT=... -DTREE=... -DWORK=... -DGENERATOR=... -DTOOLCHAIN=... -DCC=... -DCXX=... -DPOINTER_BYTES=...
#   -DNM=... -P ...
# Lays the port's headers out as a device tree does, those of TREE over them, and builds the library against that.
# Its libraries are left out, so what the library takes from the platform stays undefined.
cmake_minimum_required(VERSION 3.25)

include(${CMAKE_CURRENT_LIST_DIR}/../run.cmake)

# Copies keep their times, so what has not changed since the last run is not built again.
file(REMOVE_RECURSE ${WORK}/tree)
set(base ${WORK}/tree/frameworks/base/include)
set(openmax ${base}/media/stagefright/openmax)
set(headers ${PROJECT}/host/include)
file(COPY ${headers}/binder ${headers}/media ${headers}/utils DESTINATION ${base})
file(COPY ${headers}/android ${headers}/cutils DESTINATION ${WORK}/tree/system/core/include)
file(GLOB records ${headers}/OMX_*.h)
file(COPY ${records} DESTINATION ${openmax})
# A file that is as old as the one in its place, as in a fresh clone, would not be copied.
file(GLOB_RECURSE replaced RELATIVE ${TREE} ${TREE}/*)
list(TRANSFORM replaced PREPEND ${WORK}/tree/)
file(REMOVE ${replaced})
file(COPY ${TREE}/ DESTINATION ${WORK}/tree)
if(POINTER_BYTES EQUAL 4)
  # A device's words are long ones.
  file(READ ${openmax}/OMX_Types.h types)
  string(REPLACE "typedef uint32_t OMX_U32" "typedef unsigned long OMX_U32" types "${types}")
  string(REPLACE "typedef int32_t OMX_S32" "typedef signed long OMX_S32" types "${types}")
  file(WRITE ${openmax}/OMX_Types.h "${types}")
endif()

set(compiler -DCMAKE_C_COMPILER=${CC} -DCMAKE_CXX_COMPILER=${CXX})
if(TOOLCHAIN)
  set(compiler -DCMAKE_TOOLCHAIN_FILE=${TOOLCHAIN})
endif()
run(${CMAKE_COMMAND} -S ${PROJECT} -B ${WORK}/build -G ${GENERATOR} ${compiler} -DCMAKE_BUILD_TYPE=Debug
  -DOMXBRIDGE_WERROR=ON -DOMXBRIDGE_PLATFORM=device -DOMXBRIDGE_DEVICE_TREE=${WORK}/tree -DOMXBRIDGE_DEVICE_LIBRARIES=
  -DCMAKE_CXX_FLAGS=-DHWY_COMPILE_ONLY_STATIC)
run(${CMAKE_COMMAND} --build ${WORK}/build)

run(${NM} -D --undefined-only --demangle ${WORK}/build/lib/libomxbridge.so)
if(NOT output MATCHES "android::String16::String16\\(char const\\*\\)" OR output MATCHES "omxhost|readSocBuildId")
  message(FATAL_ERROR "taken from the platform:\n${output}")
endif()
