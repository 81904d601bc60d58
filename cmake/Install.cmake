# What an installation holds beside programs and libraries: the CMake package `velkor`, which finds
# the libraries, and the pkg-config module `velkor`, which is velkor-configuration.
include(CMakePackageConfigHelpers)

get_property(required_libraries GLOBAL PROPERTY VELKOR_REQUIRED_LIBRARIES)
list(JOIN required_libraries " " required_libraries)
configure_package_config_file(
    ${CMAKE_CURRENT_LIST_DIR}/velkor-config.cmake.in ${CMAKE_CURRENT_BINARY_DIR}/velkor-config.cmake
    INSTALL_DESTINATION ${package_dir})
write_basic_package_version_file(${CMAKE_CURRENT_BINARY_DIR}/velkor-config-version.cmake
    COMPATIBILITY SameMajorVersion)
install(
    FILES
        ${CMAKE_CURRENT_BINARY_DIR}/velkor-config.cmake
        ${CMAKE_CURRENT_BINARY_DIR}/velkor-config-version.cmake
    DESTINATION ${package_dir} COMPONENT framework)

configure_file(${CMAKE_CURRENT_LIST_DIR}/velkor.pc.in ${CMAKE_CURRENT_BINARY_DIR}/velkor.pc @ONLY)
install(FILES ${CMAKE_CURRENT_BINARY_DIR}/velkor.pc
    DESTINATION ${module_dir} COMPONENT configuration)
