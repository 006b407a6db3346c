# Installs libfileindex with its headers, pkg-config file and CMake package.

include(CMakePackageConfigHelpers)

set(packageDir "${CMAKE_INSTALL_LIBDIR}/cmake/fileindex")

# The platform belongs to the package because the linker looks for what libfileindex itself needs.
install(TARGETS fileindex vork vorknotifyd EXPORT fileindexTargets
    LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR})
install(DIRECTORY ${PROJECT_SOURCE_DIR}/include/fileindex
    DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}
    FILES_MATCHING PATTERN "*.h")

install(EXPORT fileindexTargets NAMESPACE fileindex:: DESTINATION ${packageDir})
configure_package_config_file(
    ${PROJECT_SOURCE_DIR}/cmake/fileindexConfig.cmake.in
    ${PROJECT_BINARY_DIR}/cmake/fileindexConfig.cmake
    INSTALL_DESTINATION ${packageDir})
write_basic_package_version_file(${PROJECT_BINARY_DIR}/cmake/fileindexConfigVersion.cmake
    COMPATIBILITY SameMinorVersion)
install(FILES
    ${PROJECT_BINARY_DIR}/cmake/fileindexConfig.cmake
    ${PROJECT_BINARY_DIR}/cmake/fileindexConfigVersion.cmake
    DESTINATION ${packageDir})

# Relative to the file itself, so that the tree can be moved.
file(RELATIVE_PATH pcToPrefix
    "${CMAKE_INSTALL_FULL_LIBDIR}/pkgconfig" "${CMAKE_INSTALL_PREFIX}")
string(REGEX REPLACE "/$" "" pcToPrefix "${pcToPrefix}")
configure_file(${PROJECT_SOURCE_DIR}/cmake/fileindex.pc.in ${PROJECT_BINARY_DIR}/cmake/fileindex.pc @ONLY)
install(FILES ${PROJECT_BINARY_DIR}/cmake/fileindex.pc DESTINATION ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
