# OMXBRIDGE_SANITIZE=address,undefined or thread: for the whole tree, since half a sanitized
# process reports nonsense.
if(OMXBRIDGE_SANITIZE)
  add_compile_options(-fsanitize=${OMXBRIDGE_SANITIZE} -fno-omit-frame-pointer -fno-sanitize-recover=all)
  add_link_options(-fsanitize=${OMXBRIDGE_SANITIZE})
endif()
