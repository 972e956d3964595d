# Installs pmutil into a folder and builds and runs the consumer against it, once with CMake and
# once with pkg-config.
#
# usage: cmake -DBUILD=DIR -DSOURCE=DIR -DWORK=DIR -DGENERATOR=NAME -DCOMPILER=PATH -DFLAGS=LIST
#          -P check.cmake
file(REMOVE_RECURSE ${WORK})
set(prefix ${WORK}/prefix)

function(run)
  execute_process(COMMAND ${ARGN} COMMAND_ECHO STDOUT COMMAND_ERROR_IS_FATAL ANY)
endfunction()

# expect_hello(PROGRAM): it prints what the consumer prints.
function(expect_hello program)
  execute_process(COMMAND ${program} OUTPUT_VARIABLE output COMMAND_ERROR_IS_FATAL ANY)
  if(NOT output STREQUAL "\"hello\"\n")
    message(FATAL_ERROR "${program} printed '${output}'")
  endif()
endfunction()

run(${CMAKE_COMMAND} --install ${BUILD} --component pmutil --prefix ${prefix})
string(REPLACE ";" " " flags "${FLAGS}")

run(${CMAKE_COMMAND} -G ${GENERATOR} -S ${SOURCE} -B ${WORK}/cmake -DCMAKE_PREFIX_PATH=${prefix}
  -DCMAKE_CXX_COMPILER=${COMPILER} "-DCMAKE_CXX_FLAGS=${flags}")
run(${CMAKE_COMMAND} --build ${WORK}/cmake)
expect_hello(${WORK}/cmake/consumer)

file(GLOB_RECURSE pc_file ${prefix}/pmutil.pc)
get_filename_component(pc_dir ${pc_file} DIRECTORY)
set(ENV{PKG_CONFIG_PATH} ${pc_dir})
execute_process(COMMAND pkg-config --cflags --libs pmutil OUTPUT_VARIABLE pc_flags
  OUTPUT_STRIP_TRAILING_WHITESPACE COMMAND_ERROR_IS_FATAL ANY)
separate_arguments(pc_flags UNIX_COMMAND "${pc_flags}")
run(${COMPILER} -std=c++17 ${FLAGS} ${SOURCE}/main.cpp -o ${WORK}/with-pkg-config ${pc_flags})
expect_hello(${WORK}/with-pkg-config)
