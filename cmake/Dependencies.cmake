# What the build needs from outside the tree.
set(THREADS_PREFER_PTHREAD_FLAG ON)
find_package(Threads REQUIRED)
if(WIN32)
  include(BoostWindows)
else()
  set(Boost_USE_STATIC_LIBS ON)
  find_package(Boost 1.74 REQUIRED COMPONENTS thread filesystem date_time)
endif()
