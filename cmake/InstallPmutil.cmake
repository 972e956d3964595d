# Installs pmutil for other projects: find_package(pmutil), or pkg-config pmutil. The component is
# "pmutil", so that the library can be installed without the program.
include(GNUInstallDirs)
include(CMakePackageConfigHelpers)

set(package_dir ${CMAKE_INSTALL_LIBDIR}/cmake/pmutil)
install(TARGETS pmutil EXPORT pmutilTargets
  ARCHIVE DESTINATION ${CMAKE_INSTALL_LIBDIR} COMPONENT pmutil)
install(DIRECTORY ${CMAKE_CURRENT_SOURCE_DIR}/include/pmutil
  DESTINATION ${CMAKE_INSTALL_INCLUDEDIR} COMPONENT pmutil FILES_MATCHING PATTERN "*.h"
  PATTERN "*Win*.h" EXCLUDE PATTERN "PMDebugStrLogger.h" EXCLUDE)
install(EXPORT pmutilTargets NAMESPACE pmutil:: DESTINATION ${package_dir} COMPONENT pmutil)

configure_package_config_file(${CMAKE_SOURCE_DIR}/cmake/pmutilConfig.cmake.in
  ${CMAKE_CURRENT_BINARY_DIR}/pmutilConfig.cmake INSTALL_DESTINATION ${package_dir})
write_basic_package_version_file(${CMAKE_CURRENT_BINARY_DIR}/pmutilConfigVersion.cmake
  COMPATIBILITY SameMajorVersion)
install(FILES ${CMAKE_CURRENT_BINARY_DIR}/pmutilConfig.cmake
  ${CMAKE_CURRENT_BINARY_DIR}/pmutilConfigVersion.cmake
  DESTINATION ${package_dir} COMPONENT pmutil)

# The .pc file has its prefix relative to itself, so that the installation can be moved.
file(RELATIVE_PATH prefix_from_pc /usr/${CMAKE_INSTALL_LIBDIR}/pkgconfig /usr)
configure_file(${CMAKE_SOURCE_DIR}/cmake/pmutil.pc.in ${CMAKE_CURRENT_BINARY_DIR}/pmutil.pc @ONLY)
install(FILES ${CMAKE_CURRENT_BINARY_DIR}/pmutil.pc
  DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig COMPONENT pmutil)
