# What is built for users: overruns of the stack and of buffers of known size end the program, nothing that is
# resolved at load time stays writable, and no stack is executable. Not for sanitizers, which see more.
if(NOT OMXBRIDGE_SANITIZE)
  add_compile_options(-fstack-protector-strong)
  if(NOT CMAKE_BUILD_TYPE STREQUAL "Debug")  # fortification needs the optimiser
    add_compile_options(-U_FORTIFY_SOURCE -D_FORTIFY_SOURCE=2)
  endif()
  add_link_options(LINKER:-z,relro LINKER:-z,now LINKER:-z,noexecstack)
endif()
