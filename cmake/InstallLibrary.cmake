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

# The .pc files have their prefix relative to themselves, so that the installation can be moved. One is
# of the shared library, and with --static for a wholly static program; the other of the static library
# in any program.
file(RELATIVE_PATH prefix_from_pc /usr/${CMAKE_INSTALL_LIBDIR}/pkgconfig /usr)
set(static_libraries)
set(pc_files assay-host)
if(NOT WIN32)
  set(static_libraries "-lboost_thread -lboost_filesystem -lstdc++ -lm -ldl -pthread")
  list(APPEND pc_files assay-host-static)
endif()
foreach(file IN LISTS pc_files)
  configure_file(${CMAKE_SOURCE_DIR}/cmake/${file}.pc.in ${CMAKE_CURRENT_BINARY_DIR}/${file}.pc @ONLY)
  install(FILES ${CMAKE_CURRENT_BINARY_DIR}/${file}.pc
    DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig COMPONENT libassay-host-dev)
endforeach()
