# find_package(assay-host) in the unpacked zip for Windows, with MinGW-w64. assay-host::assay-host is the
# DLL with its import library and headers. Everything is found from the place of this file, so that the
# folder can be anywhere.
if(TARGET assay-host::assay-host)
  return()
endif()
get_filename_component(assay_host_folder "${CMAKE_CURRENT_LIST_DIR}/../../.." ABSOLUTE)
add_library(assay-host::assay-host SHARED IMPORTED)
set_target_properties(assay-host::assay-host PROPERTIES
  IMPORTED_LOCATION "${assay_host_folder}/assay-host.dll"
  IMPORTED_IMPLIB "${assay_host_folder}/lib/libassay-host.dll.a"
  INTERFACE_INCLUDE_DIRECTORIES "${assay_host_folder}/include")
unset(assay_host_folder)
