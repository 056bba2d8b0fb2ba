# Sanitizers are chosen for the whole build: mixed objects would hide what they look for.
if(MARLO_SANITIZE)
  add_compile_options(-fsanitize=${MARLO_SANITIZE} -fno-omit-frame-pointer)
  add_link_options(-fsanitize=${MARLO_SANITIZE})
  if(MARLO_SANITIZE MATCHES "undefined")
    add_compile_options(-fno-sanitize-recover=undefined)
  endif()
endif()
