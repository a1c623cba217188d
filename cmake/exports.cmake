# omxbridge_export_only(TARGET LIST): TARGET exports the symbols that LIST names, and no other.
#
# LIST has one demangled symbol a line and comments behind '#'. A linker version script is made of it.
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
  set(script ${CMAKE_CURRENT_BINARY_DIR}/${target}.map)
  file(CONFIGURE OUTPUT ${script} @ONLY CONTENT
    "{\n  global:\n@plain@    extern \"C++\" {\n@cplusplus@    };\n  local: *;\n};\n")
  target_link_options(${target} PRIVATE LINKER:--version-script=${script})
  set_property(TARGET ${target} APPEND PROPERTY LINK_DEPENDS ${script})
endfunction()
