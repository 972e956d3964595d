# The compiler options of every target of the project: link `assay_options`.
add_library(assay_options INTERFACE)
target_compile_options(assay_options INTERFACE
  -Wall -Wextra -Wpedantic -Wshadow -Wconversion -Wsign-conversion -Wnon-virtual-dtor
  -Woverloaded-virtual -Wold-style-cast -Wcast-qual -Wformat=2
  $<$<BOOL:${ASSAY_WERROR}>:-Werror>
  # Make source paths in log lines and failure texts relative to the tree.
  -fmacro-prefix-map=${CMAKE_SOURCE_DIR}/=)
if(CMAKE_CXX_COMPILER_ID STREQUAL "GNU")
  target_compile_options(assay_options INTERFACE -Wduplicated-cond -Wlogical-op)
endif()

# Assertions (such as Boost's "px != 0") are part of the behaviour: no build type defines NDEBUG.
foreach(type RELEASE RELWITHDEBINFO MINSIZEREL)
  string(REPLACE "-DNDEBUG" "" CMAKE_CXX_FLAGS_${type} "${CMAKE_CXX_FLAGS_${type}}")
  string(REPLACE "-DNDEBUG" "" CMAKE_C_FLAGS_${type} "${CMAKE_C_FLAGS_${type}}")
endforeach()
