# The CMake package `velkor`: velkor::framework and velkor::configuration.
include(CMakeFindDependencyMacro)
find_dependency(Boost 1.74 COMPONENTS log)
find_dependency(Poco 1.11 COMPONENTS Foundation JSON)
find_dependency(Threads)
include(${CMAKE_CURRENT_LIST_DIR}/velkor-targets.cmake)
