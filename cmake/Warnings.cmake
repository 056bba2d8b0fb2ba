# Warnings for everything that is built here. MARLO_WERROR makes them errors.
add_compile_options(-Wall -Wextra -Wpedantic -Wconversion -Wshadow)
if(MARLO_WERROR)
  add_compile_options(-Werror)
endif()
