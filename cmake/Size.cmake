# What a server maps counts as its memory, also where it runs once or never. That is for what is run and installed; the
# rest is built to find errors in it.
set(MARLO_IS_SMALL $<CONFIG:Release,RelWithDebInfo>)
if(MARLO_SANITIZE)
  set(MARLO_IS_SMALL 0)
endif()

add_link_options($<${MARLO_IS_SMALL}:-Wl,--gc-sections>)
# Addresses that are adjusted when a program starts take three words each, or one bit (DT_RELR). The linker may know that
# where the system does not (glibc before 2.36), which is seen when a program runs.
include(CheckCXXSourceRuns)
set(CMAKE_REQUIRED_LINK_OPTIONS -Wl,-z,pack-relative-relocs)
check_cxx_source_runs("int main() {}" MARLO_PACKS_RELOCATIONS)
unset(CMAKE_REQUIRED_LINK_OPTIONS)
if(MARLO_PACKS_RELOCATIONS)
  add_link_options($<${MARLO_IS_SMALL}:-Wl,-z,pack-relative-relocs>)
endif()

# marlo_runs_seldom(target [file...]): the code of these files, or of all, runs when a server starts, or in a command that
# ends soon: less of it in memory is worth more than its speed.
function(marlo_runs_seldom target)
  set(sources ${ARGN})
  if(NOT sources)
    get_target_property(sources ${target} SOURCES)
  endif()
  set_property(SOURCE ${sources} APPEND PROPERTY COMPILE_OPTIONS $<${MARLO_IS_SMALL}:-Os>)
endfunction()
