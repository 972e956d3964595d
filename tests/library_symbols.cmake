# Compares what libassay-host exports with its binary interface, which only grows: the functions of
# ABI, one prototype a line, must be in the header as they are, and in the library, with the version
# ASSAY_HOST_1.0 in an ELF library; nothing else is exported.
#
# usage: cmake -DNM=PATH -DSONAME=NAME -DLIBRARY=FILE -DHEADER=FILE -DABI=FILE -P library_symbols.cmake
#        cmake -DOBJDUMP=PATH -DLIBRARY=FILE -DHEADER=FILE -DABI=FILE -P library_symbols.cmake
# The first form is for ELF libraries, the second for DLLs.
if(OBJDUMP)
  set(version)
  execute_process(COMMAND ${OBJDUMP} -p ${LIBRARY} OUTPUT_VARIABLE lines
    COMMAND_ERROR_IS_FATAL ANY)
  # The table of the exported names, "[ordinal] hint name", up to an empty line.
  string(REGEX MATCH "\n\\[Ordinal/Name Pointer\\] Table[^\n]*\n([^\n]+\n)*" lines "${lines}")
  string(REGEX REPLACE "^\n[^\n]*\n" "" lines "${lines}")
else()
  set(version @@ASSAY_HOST_1.0)
  if(NOT SONAME STREQUAL "libassay-host.so.0")
    message(FATAL_ERROR "the soname is ${SONAME}")
  endif()
  execute_process(COMMAND ${NM} -D --defined-only ${LIBRARY} OUTPUT_VARIABLE lines
    COMMAND_ERROR_IS_FATAL ANY)
endif()
string(REGEX MATCHALL "[^ \n]+(\n|$)" found "${lines}")
list(TRANSFORM found STRIP)
list(FILTER found EXCLUDE REGEX "^ASSAY_HOST_1.0") # the version itself

file(READ ${HEADER} header)
string(REGEX REPLACE "/[*][^*]*[*]+([^/*][^*]*[*]+)*/" "" header "${header}")
string(REGEX REPLACE "[ \n]+" " " header "${header}")
file(STRINGS ${ABI} prototypes)
set(expected)
foreach(prototype IN LISTS prototypes)
  string(FIND "${header}" "ASSAY_HOST_API ${prototype}" place)
  if(place EQUAL -1)
    message(SEND_ERROR "the header has no ${prototype}")
  endif()
  string(REGEX REPLACE "^.*(assay_host_[a-z_]+)[(].*$" "\\1" name "${prototype}")
  list(APPEND expected ${name}${version})
endforeach()
list(SORT found)
list(SORT expected)
if(NOT found STREQUAL expected)
  message(FATAL_ERROR "exported: ${found}\nexpected: ${expected}")
endif()
