# The scripted OpenCL driver, an installable client driver for any OpenCL loader. Select it with
# OCL_ICD_VENDORS=<build folder>/drivers/opencl.
add_library(scripted_opencl MODULE scripted_opencl/Model.cpp scripted_opencl/OpenCL.cpp)
target_link_libraries(scripted_opencl PRIVATE assay_options scripted_common)
set_target_properties(scripted_opencl PROPERTIES
  CXX_VISIBILITY_PRESET hidden LIBRARY_OUTPUT_DIRECTORY ${CMAKE_BINARY_DIR}/drivers/opencl)
file(GENERATE OUTPUT ${CMAKE_BINARY_DIR}/drivers/opencl/scripted.icd
  CONTENT "$<TARGET_FILE:scripted_opencl>\n")
