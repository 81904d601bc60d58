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

# Programs find the libraries that are installed with them, wherever that is.
cmake_path(RELATIVE_PATH CMAKE_INSTALL_FULL_LIBDIR
    BASE_DIRECTORY ${CMAKE_INSTALL_FULL_BINDIR} OUTPUT_VARIABLE libdir_from_bindir)
set(CMAKE_INSTALL_RPATH $ORIGIN/${libdir_from_bindir})

# Declares a shared library of this project: hidden visibility, exports filtered by the version
# script beside its sources, and an ABI number of its own. HEADERS are those that are installed.
function(velkor_add_library name)
    cmake_parse_arguments(ARG "" "EXPORT_NAME" "SOURCES;HEADERS" ${ARGN})
    add_library(${name} SHARED ${ARG_SOURCES})
    add_library(velkor::${ARG_EXPORT_NAME} ALIAS ${name})
    target_sources(${name} PUBLIC
        FILE_SET HEADERS BASE_DIRS ${PROJECT_SOURCE_DIR} FILES ${ARG_HEADERS})
    set(script ${CMAKE_CURRENT_SOURCE_DIR}/exports.map)
    set_target_properties(${name} PROPERTIES
        EXPORT_NAME ${ARG_EXPORT_NAME}
        VERSION ${PROJECT_VERSION}
        SOVERSION ${PROJECT_VERSION_MAJOR}
        INSTALL_RPATH $ORIGIN
        CXX_EXTENSIONS OFF
        CXX_VISIBILITY_PRESET hidden
        VISIBILITY_INLINES_HIDDEN ON
        LINK_DEPENDS ${script})
    target_compile_features(${name} PUBLIC cxx_std_17)
    # A call within the library goes straight to its target, so that it can be inlined.
    target_compile_options(${name} PRIVATE -fno-semantic-interposition)
    target_link_options(${name} PRIVATE
        LINKER:--version-script=${script} LINKER:--no-undefined-version)
    target_link_libraries(${name} PRIVATE $<BUILD_INTERFACE:velkor-build-options>)
    if(VELKOR_INSTALL)
        install(TARGETS ${name} EXPORT velkor-targets
            FILE_SET HEADERS DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}/velkor
            INCLUDES DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}/velkor)
    endif()
endfunction()
