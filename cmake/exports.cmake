# omxbridge_semantic_version(TARGET): a shared library whose SONAME has the project's major version, which changes
# when a program that was linked to it would no longer run.
function(omxbridge_semantic_version target)
  set_target_properties(${target} PROPERTIES VERSION ${PROJECT_VERSION} SOVERSION ${PROJECT_VERSION_MAJOR})
endfunction()

# omxbridge_export_only(TARGET LIST): TARGET exports the symbols that LIST names, and no other.
#
# LIST has one demangled symbol a line and comments behind '#'. A linker version script is made of it, which also
# puts them under the version NAME_MAJOR: programs then say which generation of the library they were linked to, and
# two of them in one process do not mix up.
function(omxbridge_export_only target list)
  set_property(DIRECTORY APPEND PROPERTY CMAKE_CONFIGURE_DEPENDS ${list})
  file(STRINGS ${list} symbols REGEX "^[^#]")
  set(plain "")
  set(cplusplus "")
  foreach(symbol IN LISTS symbols)
    if(symbol MATCHES "^[A-Za-z0-9_]+$")
      string(APPEND plain "    ${symbol};\n")
    else()
      string(APPEND cplusplus "      \"${symbol}\";\n")
    endif()
  endforeach()
  string(TOUPPER ${target}_${PROJECT_VERSION_MAJOR} version)
  set(script ${CMAKE_CURRENT_BINARY_DIR}/${target}.map)
  file(CONFIGURE OUTPUT ${script} @ONLY CONTENT
    "@version@ {\n  global:\n@plain@    extern \"C++\" {\n@cplusplus@    };\n  local: *;\n};\n")
  target_link_options(${target} PRIVATE LINKER:--version-script=${script})
  set_property(TARGET ${target} APPEND PROPERTY LINK_DEPENDS ${script})
endfunction()
