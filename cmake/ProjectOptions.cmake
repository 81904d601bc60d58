# What every target of this build has in common. Warnings are errors for the project's own build
# only: the flags stay private to its targets and never reach a program that uses the libraries.

add_library(velkor-build-options INTERFACE)
target_compile_features(velkor-build-options INTERFACE cxx_std_17)

if(PROJECT_IS_TOP_LEVEL)
    target_compile_options(velkor-build-options INTERFACE
        -Wall -Wextra -Wpedantic -Werror
        -Wshadow -Wconversion -Wsign-conversion -Wold-style-cast -Wcast-qual
        -Wnon-virtual-dtor -Woverloaded-virtual -Wformat=2 -Wundef
        $<$<CXX_COMPILER_ID:GNU>:-Wduplicated-cond -Wlogical-op -Wsuggest-override>
        $<$<CXX_COMPILER_ID:Clang>:-Wthread-safety -Winconsistent-missing-override>)
endif()

# Declares a shared library of this project: hidden visibility, exports filtered by the version
# script beside its sources, and an ABI number of its own.
function(velkor_add_library name)
    cmake_parse_arguments(ARG "" "EXPORT_NAME" "SOURCES;HEADERS" ${ARGN})
    add_library(${name} SHARED ${ARG_SOURCES} ${ARG_HEADERS})
    add_library(velkor::${ARG_EXPORT_NAME} ALIAS ${name})
    set(script ${CMAKE_CURRENT_SOURCE_DIR}/exports.map)
    set_target_properties(${name} PROPERTIES
        EXPORT_NAME ${ARG_EXPORT_NAME}
        VERSION ${PROJECT_VERSION}
        SOVERSION ${PROJECT_VERSION_MAJOR}
        CXX_EXTENSIONS OFF
        CXX_VISIBILITY_PRESET hidden
        VISIBILITY_INLINES_HIDDEN ON
        LINK_DEPENDS ${script})
    target_compile_features(${name} PUBLIC cxx_std_17)
    target_include_directories(${name} PUBLIC
        $<BUILD_INTERFACE:${PROJECT_SOURCE_DIR}>
        $<INSTALL_INTERFACE:${CMAKE_INSTALL_INCLUDEDIR}/velkor>)
    target_link_options(${name} PRIVATE LINKER:--version-script=${script} LINKER:--no-undefined-version)
    target_link_libraries(${name} PRIVATE $<BUILD_INTERFACE:velkor-build-options>)
    install(TARGETS ${name} EXPORT velkor-targets
        LIBRARY DESTINATION ${CMAKE_INSTALL_LIBDIR}
        ARCHIVE DESTINATION ${CMAKE_INSTALL_LIBDIR})
    foreach(header IN LISTS ARG_HEADERS)
        cmake_path(RELATIVE_PATH CMAKE_CURRENT_SOURCE_DIR
            BASE_DIRECTORY ${PROJECT_SOURCE_DIR} OUTPUT_VARIABLE module)
        cmake_path(GET header PARENT_PATH folder)
        install(FILES ${header} DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}/velkor/${module}/${folder})
    endforeach()
endfunction()
