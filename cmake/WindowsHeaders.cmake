# Headers of the distribution that are the same on every platform, for the cross-compiler: reached
# through a folder that holds only links to them, so that no Linux header comes along.
set(folder ${CMAKE_BINARY_DIR}/include)
file(MAKE_DIRECTORY ${folder})
foreach(library boost CL)
  file(CREATE_LINK /usr/include/${library} ${folder}/${library} SYMBOLIC)
endforeach()
add_library(windows_headers INTERFACE)
target_include_directories(windows_headers SYSTEM INTERFACE ${folder})
