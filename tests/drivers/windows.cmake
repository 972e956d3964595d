# Drivers for Windows. OpenCL.dll has all entry points that the program looks up; each of them
# misbehaves as ASSAY_MISBEHAVE says. planted.dll prints a line to standard error when it is loaded;
# tests copy it under the names of other libraries.
set(table ${CMAKE_SOURCE_DIR}/qgf/include/qgf/OCLFunctionTable.h)
set_property(DIRECTORY APPEND PROPERTY CMAKE_CONFIGURE_DEPENDS ${table})
file(READ ${table} text)
string(REGEX MATCHALL "CALLED\\(cl[A-Za-z0-9]+\\)" entries "${text}")
set(exports "EXPORTS\n")
foreach(entry ${entries})
  string(REGEX REPLACE "^CALLED\\((.+)\\)$" "\\1" name ${entry})
  string(APPEND exports "${name} = Misbehaving\n")
endforeach()
file(GENERATE OUTPUT ${CMAKE_CURRENT_BINARY_DIR}/OpenCL.def CONTENT "${exports}")
add_library(misbehaving_opencl MODULE misbehaving_opencl/OpenCL.cpp
  ${CMAKE_SOURCE_DIR}/tests/children/win/Misbehave.cpp)
target_include_directories(misbehaving_opencl PRIVATE ${CMAKE_SOURCE_DIR}/tests/children)
target_link_libraries(misbehaving_opencl PRIVATE assay_options
  ${CMAKE_CURRENT_BINARY_DIR}/OpenCL.def)
set_target_properties(misbehaving_opencl PROPERTIES PREFIX "" OUTPUT_NAME OpenCL
  LIBRARY_OUTPUT_DIRECTORY ${CMAKE_BINARY_DIR}/drivers/opencl)

add_library(planted MODULE planted/Planted.cpp)
target_link_libraries(planted PRIVATE assay_options)
set_target_properties(planted PROPERTIES PREFIX ""
  LIBRARY_OUTPUT_DIRECTORY ${CMAKE_BINARY_DIR}/drivers/planted)
