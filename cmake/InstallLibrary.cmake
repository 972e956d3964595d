# Installs libassay-host for other projects: find_package(assay-host), or pkg-config assay-host. The
# component libassay-host is what a program needs to run, libassay-host-dev what it needs to be built.
include(CMakePackageConfigHelpers)

set(package_dir ${CMAKE_INSTALL_LIBDIR}/cmake/assay-host)
set(targets assay_host_shared)
if(NOT WIN32)
  list(APPEND targets assay_host_static)
endif()
install(TARGETS ${targets} EXPORT assay-hostTargets
  RUNTIME DESTINATION ${CMAKE_INSTALL_BINDIR} COMPONENT libassay-host
  LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR} COMPONENT libassay-host
    NAMELINK_COMPONENT libassay-host-dev
  ARCHIVE DESTINATION ${CMAKE_INSTALL_LIBDIR} COMPONENT libassay-host-dev)
install(DIRECTORY ${CMAKE_CURRENT_SOURCE_DIR}/include/
  DESTINATION ${CMAKE_INSTALL_INCLUDEDIR} COMPONENT libassay-host-dev)
install(EXPORT assay-hostTargets NAMESPACE assay-host:: DESTINATION ${package_dir}
  COMPONENT libassay-host-dev)

configure_package_config_file(${CMAKE_SOURCE_DIR}/cmake/assay-hostConfig.cmake.in
  ${CMAKE_CURRENT_BINARY_DIR}/assay-hostConfig.cmake INSTALL_DESTINATION ${package_dir})
write_basic_package_version_file(${CMAKE_CURRENT_BINARY_DIR}/assay-hostConfigVersion.cmake
  COMPATIBILITY SameMajorVersion)
install(FILES ${CMAKE_CURRENT_BINARY_DIR}/assay-hostConfig.cmake
  ${CMAKE_CURRENT_BINARY_DIR}/assay-hostConfigVersion.cmake
  DESTINATION ${package_dir} COMPONENT libassay-host-dev)

# The .pc file has its prefix relative to itself, so that the installation can be moved.
file(RELATIVE_PATH prefix_from_pc /usr/${CMAKE_INSTALL_LIBDIR}/pkgconfig /usr)
configure_file(${CMAKE_SOURCE_DIR}/cmake/assay-host.pc.in
  ${CMAKE_CURRENT_BINARY_DIR}/assay-host.pc @ONLY)
install(FILES ${CMAKE_CURRENT_BINARY_DIR}/assay-host.pc
  DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig COMPONENT libassay-host-dev)
