# Fails if the C++ wrapper leaves a function of the C interface out.
#
# usage: cmake -DHEADER=FILE -DWRAPPER=FILE -P check_wrapper.cmake
file(READ ${HEADER} header)
string(REGEX REPLACE "/[*][^*]*[*]+([^/*][^*]*[*]+)*/" "" header "${header}")
string(REGEX MATCHALL "\nASSAY_HOST_API [^(]*[(]" declared "${header}")
if(NOT declared)
  message(FATAL_ERROR "${HEADER} has no function")
endif()
file(READ ${WRAPPER} wrapper)
string(REGEX REPLACE "//[^\n]*" "" wrapper "${wrapper}")
foreach(declaration IN LISTS declared)
  string(REGEX REPLACE "^.*(assay_host_[a-z_]+)[(]$" "\\1" name "${declaration}")
  # It is called, or passed to one that calls it.
  if(NOT wrapper MATCHES "[^a-z_]${name}[(),]")
    message(SEND_ERROR "the wrapper has no ${name}")
  endif()
endforeach()
