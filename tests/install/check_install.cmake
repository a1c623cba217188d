# cmake -DBUILD=... -DWORK=..., and what use_installed.cmake takes, -P check_install.cmake
# Installs the build, moves it, and uses it.
cmake_minimum_required(VERSION 3.25)
file(REMOVE_RECURSE ${WORK})
execute_process(COMMAND ${CMAKE_COMMAND} --install ${BUILD} --prefix ${WORK}/installed OUTPUT_QUIET
  COMMAND_ERROR_IS_FATAL ANY)
file(RENAME ${WORK}/installed ${WORK}/moved)
set(PREFIX ${WORK}/moved)
include(${CMAKE_CURRENT_LIST_DIR}/use_installed.cmake)
