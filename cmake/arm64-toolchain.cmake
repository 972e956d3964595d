# Cross-builds for 64-bit ARM with the distribution's compiler and the arm64 packages that
# scripts/fetch-arm64-root unpacks in build/deps/arm64.
set(ASSAY_ARM64_ROOT ${CMAKE_CURRENT_LIST_DIR}/../build/deps/arm64 CACHE PATH "Unpacked packages for arm64")
list(APPEND CMAKE_TRY_COMPILE_PLATFORM_VARIABLES ASSAY_ARM64_ROOT)
get_filename_component(root ${ASSAY_ARM64_ROOT} ABSOLUTE)
set(triplet aarch64-linux-gnu)
set(CMAKE_SYSTEM_NAME Linux)
set(CMAKE_SYSTEM_PROCESSOR aarch64)
set(CMAKE_LIBRARY_ARCHITECTURE ${triplet})
set(CMAKE_C_COMPILER ${triplet}-gcc)
set(CMAKE_CXX_COMPILER ${triplet}-g++)
set(CMAKE_SYSROOT ${root})
set(CMAKE_FIND_ROOT_PATH_MODE_PROGRAM NEVER)
set(CMAKE_FIND_ROOT_PATH_MODE_LIBRARY ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_INCLUDE ONLY)
set(CMAKE_FIND_ROOT_PATH_MODE_PACKAGE ONLY)
# Programs of this machine can't load the libraries.
set(ASSAY_EMULATED ON)
# The programs find the loader and the libraries in the unpacked packages, so that they run here under
# emulation, whoever starts them. libm is named for the C++ library, which has no such path.
set(found "-Wl,--enable-new-dtags -Wl,-rpath,${root}/lib/${triplet}:${root}/usr/lib/${triplet}")
set(CMAKE_EXE_LINKER_FLAGS_INIT
  "-Wl,--dynamic-linker=${root}/lib/ld-linux-aarch64.so.1 ${found} -Wl,--no-as-needed -lm")
set(CMAKE_SHARED_LINKER_FLAGS_INIT ${found})
