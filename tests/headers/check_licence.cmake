# Fails if a file that others copy or install doesn't name its licence by itself.
#
# usage: cmake -DSOURCE=DIR -P check_licence.cmake    SOURCE is the folder of the tree
file(GLOB files ${SOURCE}/pmutil/include/pmutil/*.h ${SOURCE}/host/library/include/*
  ${SOURCE}/examples/*.c ${SOURCE}/examples/*.cpp ${SOURCE}/examples/*.js ${SOURCE}/examples/*.py)
if(NOT files)
  message(FATAL_ERROR "no files in ${SOURCE}")
endif()
foreach(file IN LISTS files)
  file(STRINGS ${file} tags REGEX "SPDX-(FileCopyrightText: 2|License-Identifier: MIT)")
  list(LENGTH tags count)
  if(NOT count EQUAL 2)
    message(SEND_ERROR "${file} has no copyright or licence")
  endif()
endforeach()
