# cmake -DBUILD=... -DEXAMPLES=... -DWORK=... -DGENERATOR=... -DCC=... -DCXX=... -DCTEST=... -DVERSION=... -P ...
# Installs the build, moves it, builds the examples against it with CMake and one with pkg-config, and runs them.
cmake_minimum_required(VERSION 3.25)

function(run)
  execute_process(COMMAND ${ARGN} RESULT_VARIABLE result OUTPUT_VARIABLE output ERROR_VARIABLE output)
  if(result)
    message(FATAL_ERROR "${ARGN}: ${result}\n${output}")
  endif()
  set(output "${output}" PARENT_SCOPE)
endfunction()

file(REMOVE_RECURSE ${WORK})
run(${CMAKE_COMMAND} --install ${BUILD} --prefix ${WORK}/installed)
file(RENAME ${WORK}/installed ${WORK}/moved)

run(${CMAKE_COMMAND} -S ${EXAMPLES} -B ${WORK}/build -G ${GENERATOR} -DCMAKE_PREFIX_PATH=${WORK}/moved
  -DCMAKE_C_COMPILER=${CC} -DCMAKE_CXX_COMPILER=${CXX} "-DCMAKE_C_FLAGS=-Wall -Wextra -Werror"
  "-DCMAKE_CXX_FLAGS=-Wall -Wextra -Werror")
run(${CMAKE_COMMAND} --build ${WORK}/build)
run(${CTEST} --test-dir ${WORK}/build --output-on-failure --no-tests=error)

file(GLOB_RECURSE package ${WORK}/moved/omxbridge.pc)
cmake_path(GET package PARENT_PATH directory)
set(ENV{PKG_CONFIG_PATH} ${directory})
run(pkg-config --modversion omxbridge)
if(NOT output STREQUAL "${VERSION}\n")
  message(FATAL_ERROR "pkg-config says version ${output}")
endif()
run(pkg-config --cflags --libs omxbridge)
separate_arguments(flags UNIX_COMMAND "${output}")
run(${CC} ${EXAMPLES}/encoder.c -o ${WORK}/encoder ${flags} -pthread -Wl,-rpath-link,${directory}/..)

run(${WORK}/moved/bin/omxbridge --version)
if(NOT output MATCHES "${VERSION}")
  message(FATAL_ERROR "the installed tool says version ${output}")
endif()
