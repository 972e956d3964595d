# Boost for Windows: the packaged headers (WindowsHeaders), and the compiled libraries, built here from
# the source of the same version in the distribution (ASSAY_BOOST_SOURCE, filled by
# scripts/fetch-boost-source).
set(ASSAY_BOOST_SOURCE ${CMAKE_SOURCE_DIR}/build/deps/boost CACHE PATH "Unpacked Boost source")
if(NOT EXISTS ${ASSAY_BOOST_SOURCE}/libs/thread/src)
  message(FATAL_ERROR "No Boost source in ${ASSAY_BOOST_SOURCE}: run scripts/build windows to fetch it")
endif()

set(libs ${ASSAY_BOOST_SOURCE}/libs)
file(GLOB sources
  ${libs}/thread/src/future.cpp ${libs}/thread/src/win32/*.cpp
  ${libs}/chrono/src/*.cpp
  ${libs}/filesystem/src/*.cpp)
add_library(boost_windows STATIC ${sources})
target_link_libraries(boost_windows PUBLIC windows_headers)
target_compile_definitions(boost_windows
  PUBLIC BOOST_ALL_NO_LIB BOOST_THREAD_USE_LIB BOOST_USE_WINDOWS_H BOOST_SYSTEM_NO_DEPRECATED
    BOOST_CHRONO_STATIC_LINK BOOST_FILESYSTEM_STATIC_LINK
  PRIVATE BOOST_THREAD_BUILD_LIB BOOST_CHRONO_SOURCE BOOST_FILESYSTEM_SOURCE WIN32_LEAN_AND_MEAN
    _WIN32_WINNT=0x0601)
target_compile_options(boost_windows PRIVATE -w)
foreach(component headers thread filesystem date_time)
  add_library(boost_windows_${component} INTERFACE)
  target_link_libraries(boost_windows_${component} INTERFACE boost_windows)
  add_library(Boost::${component} ALIAS boost_windows_${component})
endforeach()
