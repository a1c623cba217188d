# cmake -DLIBRARY=... -DSYMBOLS=... -DNM=... -DREADELF=... -P check_exports.cmake
# Fails where the library exports anything but the listed symbols at its version ('+': exported and not listed,
# '-': the other way round), has another SONAME than applications link to, or needs a library that is not allowed.
cmake_minimum_required(VERSION 3.25)

# What the library may stand on: the platform, the vector library, the language's runtime, a sanitizer's. No codec.
set(allowed "^lib(omxhost|hwy|stdc\\+\\+|gcc_s|c\\+\\+|c\\+\\+abi|m|c|pthread|asan|ubsan|tsan)\\.so|^ld-linux")
set(soname "libomxbridge.so.1")
set(version "OMXBRIDGE_1")

function(run out)
  execute_process(COMMAND ${ARGN} OUTPUT_VARIABLE text RESULT_VARIABLE result)
  if(result)
    message(FATAL_ERROR "${ARGN}: ${result}")
  endif()
  string(REPLACE "\n" ";" lines "${text}")
  set(${out} "${lines}" PARENT_SCOPE)
endfunction()

set(faults "")

file(STRINGS ${SYMBOLS} listed REGEX "^[^#]")
run(lines ${NM} -D --defined-only --demangle --with-symbol-versions ${LIBRARY})
set(exported "")
foreach(line IN LISTS lines)
  if(line MATCHES "^[0-9a-f]+ . (.*)@@${version}$")
    list(APPEND exported "${CMAKE_MATCH_1}")
  elseif(NOT line MATCHES "^(0+ A ${version})?$")
    string(REGEX REPLACE "^[0-9a-f]+ . " "" symbol "${line}")
    list(APPEND exported "${symbol}")  # of another version or none
  endif()
endforeach()
list(REMOVE_DUPLICATES exported)  # the forms of a constructor or destructor
foreach(symbol IN LISTS exported)
  if(NOT symbol IN_LIST listed)
    string(APPEND faults "  + ${symbol}\n")
  endif()
endforeach()
foreach(symbol IN LISTS listed)
  if(NOT symbol IN_LIST exported)
    string(APPEND faults "  - ${symbol}\n")
  endif()
endforeach()

run(lines ${READELF} -d -W ${LIBRARY})
foreach(line IN LISTS lines)
  if(line MATCHES "\\(SONAME\\).*\\[(.*)\\]" AND NOT CMAKE_MATCH_1 STREQUAL soname)
    string(APPEND faults "  SONAME is ${CMAKE_MATCH_1}, not ${soname}\n")
  elseif(line MATCHES "\\(NEEDED\\).*\\[(.*)\\]")
    set(needed ${CMAKE_MATCH_1})  # the next match forgets it
    if(NOT needed MATCHES "${allowed}")
      string(APPEND faults "  needs ${needed}\n")
    endif()
  endif()
endforeach()
if(NOT lines MATCHES "\\(SONAME\\)")
  string(APPEND faults "  no SONAME\n")
endif()

if(faults)
  message(FATAL_ERROR "${LIBRARY} against ${SYMBOLS}:\n${faults}")
endif()
