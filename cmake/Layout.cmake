# The build tree is laid out as the installed tree is, so that marlo finds its libraries, its schema and its
# registrations relative to itself in both:
#   bin/marlo   lib/marlo/*.so   share/marlo/schema/*.mof   share/marlo/providers/*.toml
set(MARLO_LIBRARY_DIR ${PROJECT_BINARY_DIR}/lib/marlo)
set(MARLO_SHARE_DIR ${PROJECT_BINARY_DIR}/share/marlo)
set(CMAKE_RUNTIME_OUTPUT_DIRECTORY ${PROJECT_BINARY_DIR}/bin)

# marlo_product_library(target): a product that is installed and that other products find beside themselves.
function(marlo_product_library target)
  set_target_properties(${target} PROPERTIES
    LIBRARY_OUTPUT_DIRECTORY ${MARLO_LIBRARY_DIR}
    BUILD_RPATH_USE_ORIGIN ON
    BUILD_WITH_INSTALL_RPATH ON
    INSTALL_RPATH "$ORIGIN")
  target_link_options(${target} PRIVATE -Wl,--no-undefined)
  install(TARGETS ${target} LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR}/marlo)
endfunction()

# marlo_share(directory file...): data files of the current source directory, copied when they change.
function(marlo_share directory)
  foreach(file IN LISTS ARGN)
    configure_file(${file} ${MARLO_SHARE_DIR}/${directory}/${file} COPYONLY)
    install(FILES ${file} DESTINATION ${CMAKE_INSTALL_DATADIR}/marlo/${directory})
  endforeach()
endfunction()
