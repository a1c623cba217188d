# One list of warnings for every target of the project; errors where OMXBRIDGE_WERROR is on (CI).
add_library(omxbridge_warnings INTERFACE)
target_compile_options(omxbridge_warnings INTERFACE
  -Wall -Wextra -Wpedantic -Wconversion -Wsign-conversion -Wshadow -Wundef -Wformat=2 -Wcast-align
  $<$<COMPILE_LANGUAGE:CXX>:-Wold-style-cast -Wnon-virtual-dtor -Woverloaded-virtual -Wextra-semi>
  $<$<BOOL:${OMXBRIDGE_WERROR}>:-Werror>)
