# What an installation holds beside programs, libraries and headers: the CMake package `velkor` with
# the targets velkor::framework and velkor::configuration, and the pkg-config module `velkor`.
include(CMakePackageConfigHelpers)

set(package_dir ${CMAKE_INSTALL_LIBDIR}/cmake/velkor)
install(EXPORT velkor-targets NAMESPACE velkor:: DESTINATION ${package_dir})
write_basic_package_version_file(${CMAKE_CURRENT_BINARY_DIR}/velkor-config-version.cmake
    COMPATIBILITY SameMajorVersion)
install(FILES cmake/velkor-config.cmake ${CMAKE_CURRENT_BINARY_DIR}/velkor-config-version.cmake
    DESTINATION ${package_dir})

# The module finds its prefix from where it lies, so that an installed tree can be moved.
set(module_dir ${CMAKE_INSTALL_LIBDIR}/pkgconfig)
cmake_path(RELATIVE_PATH CMAKE_INSTALL_PREFIX
    BASE_DIRECTORY ${CMAKE_INSTALL_FULL_LIBDIR}/pkgconfig OUTPUT_VARIABLE prefix_from_module)
configure_file(cmake/velkor.pc.in ${CMAKE_CURRENT_BINARY_DIR}/velkor.pc @ONLY)
install(FILES ${CMAKE_CURRENT_BINARY_DIR}/velkor.pc DESTINATION ${module_dir})
