# assay_link_map(TARGET) makes the linker write what it puts into the program or shared library to
# link-maps/NAME.map, with the file's NAME, if ASSAY_LINK_MAPS is set. scripts/packages/third-party reads it.
function(assay_link_map target)
  if(NOT ASSAY_LINK_MAPS)
    return()
  endif()
  set(folder ${CMAKE_BINARY_DIR}/link-maps)
  file(MAKE_DIRECTORY ${folder})
  target_link_options(${target} PRIVATE -Wl,-Map=${folder}/$<TARGET_FILE_NAME:${target}>.map)
endfunction()
