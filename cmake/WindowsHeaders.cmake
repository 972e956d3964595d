# Headers of the distribution that are the same on every platform, for the cross-compiler: reached
# through a folder that holds only links to them, so that no Linux header comes along.
set(folder ${CMAKE_BINARY_DIR}/include)
file(MAKE_DIRECTORY ${folder})
foreach(library boost CL CLI fmt nlohmann)
  file(CREATE_LINK /usr/include/${library} ${folder}/${library} SYMBOLIC)
endforeach()
add_library(windows_headers INTERFACE)
target_include_directories(windows_headers SYSTEM INTERFACE ${folder})

# What find_package gives on Linux, for the libraries that are headers only.
foreach(target nlohmann_json::nlohmann_json CLI11::CLI11)
  add_library(${target} INTERFACE IMPORTED)
  target_link_libraries(${target} INTERFACE windows_headers)
endforeach()
add_library(fmt::fmt-header-only INTERFACE IMPORTED)
target_link_libraries(fmt::fmt-header-only INTERFACE windows_headers)
target_compile_definitions(fmt::fmt-header-only INTERFACE FMT_HEADER_ONLY=1)
