# Installs libassay-host and assay into a folder, moves the folder, and builds the examples with it, with
# CMake and with pkg-config, shared and static. Runs them there, and after the folder was moved again.
#
# usage: cmake -DBUILD=DIR -DSOURCE=DIR -DEXAMPLES=DIR -DWORK=DIR -DGENERATOR=NAME -DC_COMPILER=PATH
#          -DCXX_COMPILER=PATH -DFLAGS=LIST -DCHILD=PATH -P check.cmake
file(REMOVE_RECURSE ${WORK})
string(REPLACE ";" " " flags "${FLAGS}")

function(run)
  execute_process(COMMAND ${ARGN} COMMAND_ECHO STDOUT COMMAND_ERROR_IS_FATAL ANY)
endfunction()

# move(FROM TO): moves the installation, and sets `library` to the new path of the shared library.
function(move from to)
  file(RENAME ${WORK}/${from} ${WORK}/${to})
  file(GLOB_RECURSE library ${WORK}/${to}/*/libassay-host.so.0)
  if(NOT library)
    message(FATAL_ERROR "there is no libassay-host.so.0 in ${WORK}/${to}")
  endif()
  set(library ${library} PARENT_SCOPE)
endfunction()

# expect(PATTERN PROGRAM [argument...]): the output matches the regular expression.
function(expect pattern)
  execute_process(COMMAND ${ARGN} OUTPUT_VARIABLE output COMMAND_ERROR_IS_FATAL ANY)
  if(NOT output MATCHES "${pattern}")
    message(FATAL_ERROR "${ARGN} printed '${output}'")
  endif()
endfunction()

# check(PROGRAM): it reports a child that crashes; one with the shared library also finds the installed
# assay.
function(check program)
  expect("^crashed: .*\nOpenGL unknown: " ${program} ${CHILD} abort)
  execute_process(COMMAND ldd ${program} OUTPUT_VARIABLE needed COMMAND_ERROR_IS_FATAL ANY)
  get_filename_component(name ${program} NAME)
  if(name MATCHES "^static" AND needed MATCHES "libassay-host")
    message(FATAL_ERROR "${program} isn't linked statically: ${needed}")
  elseif(NOT name MATCHES "^static")
    expect("^(complete|failed-tests): .*\nOpenGL [a-z]+: " ${program})
  endif()
endfunction()

foreach(component libassay-host libassay-host-dev assay-host)
  run(${CMAKE_COMMAND} --install ${BUILD} --component ${component} --prefix ${WORK}/first)
endforeach()
move(first second)

run(${CMAKE_COMMAND} -G ${GENERATOR} -S ${SOURCE} -B ${WORK}/cmake -DEXAMPLES=${EXAMPLES}
  -DCMAKE_PREFIX_PATH=${WORK}/second -DCMAKE_C_COMPILER=${C_COMPILER} -DCMAKE_C_FLAGS=${flags}
  -DCMAKE_CXX_COMPILER=${CXX_COMPILER} -DCMAKE_CXX_FLAGS=${flags})
run(${CMAKE_COMMAND} --build ${WORK}/cmake)
set(programs)
foreach(program assay-host-c assay-host-cpp static-c static-cpp)
  list(APPEND programs ${WORK}/cmake/${program})
endforeach()

get_filename_component(library_folder ${library} DIRECTORY)
set(ENV{PKG_CONFIG_PATH} ${library_folder}/pkgconfig)
# build(PROGRAM PACKAGE COMPILER OPTION SOURCE) builds with the flags of pkg-config.
function(build program package compiler option source)
  execute_process(COMMAND pkg-config --cflags --libs ${package} OUTPUT_VARIABLE pc_flags
    OUTPUT_STRIP_TRAILING_WHITESPACE COMMAND_ERROR_IS_FATAL ANY)
  separate_arguments(pc_flags UNIX_COMMAND "${pc_flags}")
  run(${compiler} ${option} ${FLAGS} ${EXAMPLES}/${source} -o ${WORK}/pkg-config/${program}
    ${pc_flags} -Wl,-rpath,${library_folder})
endfunction()
file(MAKE_DIRECTORY ${WORK}/pkg-config)
build(c assay-host ${C_COMPILER} -std=c99 decide.c)
build(cpp assay-host ${CXX_COMPILER} -std=c++17 decide.cpp)
build(static-c assay-host-static ${C_COMPILER} -std=c99 decide.c)
build(static-cpp assay-host-static ${CXX_COMPILER} -std=c++17 decide.cpp)
foreach(program c cpp static-c static-cpp)
  list(APPEND programs ${WORK}/pkg-config/${program})
endforeach()

foreach(program IN LISTS programs)
  check(${program})
endforeach()
move(second third)
get_filename_component(library_folder ${library} DIRECTORY)
set(ENV{LD_LIBRARY_PATH} ${library_folder})
foreach(program IN LISTS programs)
  check(${program})
endforeach()
