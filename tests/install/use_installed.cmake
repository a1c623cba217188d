# cmake -DPREFIX=... -DEXAMPLES=... -DWORK=... -DGENERATOR=... -DCC=... -DCXX=... -DVERSION=... -P use_installed.cmake
# Does what a new user of an installed omxbridge does: builds the examples with CMake and two of them, in C and in
# C++, with pkg-config, runs them, and makes a call with the tool.
cmake_minimum_required(VERSION 3.25)

include(${CMAKE_CURRENT_LIST_DIR}/../run.cmake)

cmake_path(GET CMAKE_COMMAND PARENT_PATH cmake_directory)
run(${CMAKE_COMMAND} -S ${EXAMPLES} -B ${WORK}/cmake -G ${GENERATOR} -DCMAKE_PREFIX_PATH=${PREFIX}
  -DCMAKE_C_COMPILER=${CC} -DCMAKE_CXX_COMPILER=${CXX} "-DCMAKE_C_FLAGS=-Wall -Wextra -Werror"
  "-DCMAKE_CXX_FLAGS=-Wall -Wextra -Werror")
file(STRINGS ${WORK}/cmake/CMakeCache.txt found REGEX "^omxbridge_DIR:")
string(FIND "${found}" "=${PREFIX}/" place)
if(place EQUAL -1)
  message(FATAL_ERROR "not the installed package, but ${found}")
endif()
run(${CMAKE_COMMAND} --build ${WORK}/cmake)
run(${cmake_directory}/ctest --test-dir ${WORK}/cmake --output-on-failure --no-tests=error)

file(GLOB_RECURSE package ${PREFIX}/lib*/omxbridge.pc)
cmake_path(GET package PARENT_PATH directory)
set(ENV{PKG_CONFIG_PATH} ${directory})
run(pkg-config --modversion omxbridge)
if(NOT output STREQUAL "${VERSION}\n")
  message(FATAL_ERROR "pkg-config says version ${output}")
endif()
run(pkg-config --cflags --libs omxbridge)
separate_arguments(flags UNIX_COMMAND "${output}")
cmake_path(GET directory PARENT_PATH libraries)
list(APPEND flags -pthread -Wl,-rpath,${libraries} -Wl,-rpath-link,${libraries})
run(${CC} ${EXAMPLES}/encoder.c -o ${WORK}/encoder ${flags})
run(${CXX} -std=c++17 ${EXAMPLES}/decoder.cpp -o ${WORK}/decoder ${flags})
run(${WORK}/encoder ${WORK}/coded.264)
run(${WORK}/decoder ${WORK}/coded.264 ${WORK}/decoded.yuv)

run(${PREFIX}/bin/omxbridge --version)
if(NOT output MATCHES "${VERSION}")
  message(FATAL_ERROR "the installed tool says version ${output}")
endif()
run(${PREFIX}/bin/omxbridge call -n 10 --report ${WORK}/report.html)
if(NOT EXISTS ${WORK}/report.html)
  message(FATAL_ERROR "a call without a report:\n${output}")
endif()
