# The distribution's headers that are the same on every platform, for the cross-compiler. The include
# folder has only links to them, so that no other header of Linux is found.
set(folder ${CMAKE_BINARY_DIR}/include)
file(MAKE_DIRECTORY ${folder})
foreach(library boost CL CLI fmt nlohmann)
  file(CREATE_LINK /usr/include/${library} ${folder}/${library} SYMBOLIC)
endforeach()
add_library(windows_headers INTERFACE)
target_include_directories(windows_headers SYSTEM INTERFACE ${folder})

# The targets that find_package defines on Linux for header-only libraries.
foreach(target nlohmann_json::nlohmann_json CLI11::CLI11)
  add_library(${target} INTERFACE IMPORTED)
  target_link_libraries(${target} INTERFACE windows_headers)
endforeach()
add_library(fmt::fmt-header-only INTERFACE IMPORTED)
target_link_libraries(fmt::fmt-header-only INTERFACE windows_headers)
target_compile_definitions(fmt::fmt-header-only INTERFACE FMT_HEADER_ONLY=1)
