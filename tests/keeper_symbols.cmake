# Fails if the keeper's object needs a symbol of another one.
#
# usage: cmake -DNM=PATH -DOBJECTS=LIST -P keeper_symbols.cmake
list(FILTER OBJECTS INCLUDE REGEX "/Keeper\\.cpp\\.o$")
list(LENGTH OBJECTS count)
if(NOT count EQUAL 1)
  message(FATAL_ERROR "the keeper's object isn't there")
endif()
execute_process(COMMAND ${NM} -u ${OBJECTS} OUTPUT_VARIABLE needed COMMAND_ERROR_IS_FATAL ANY)
string(REPLACE "_GLOBAL_OFFSET_TABLE_" "" needed "${needed}") # of position-independent code
string(REGEX REPLACE "[ \t\n]+U?" "" needed "${needed}")
if(NOT needed STREQUAL "")
  message(FATAL_ERROR "the keeper needs ${needed}")
endif()
