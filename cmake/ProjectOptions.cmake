# What every target of this build has in common. Warnings are errors for the project's own build
# only: the flags stay private to its targets and never reach a program that uses the libraries.

add_library(velkor-build-options INTERFACE)
target_compile_features(velkor-build-options INTERFACE cxx_std_17)

if(PROJECT_IS_TOP_LEVEL)
    target_compile_options(velkor-build-options INTERFACE
        -Wall -Wextra -Wpedantic -Werror
        -Wconversion -Wsign-conversion -Wold-style-cast -Wcast-qual
        -Wnon-virtual-dtor -Woverloaded-virtual -Wformat=2 -Wundef
        # Sources that are compiled as one see each other's names, which shadow nothing alone, and
        # are headers in the eyes of the compiler.
        $<IF:$<BOOL:$<TARGET_PROPERTY:UNITY_BUILD>>,$<$<CXX_COMPILER_ID:GNU>:-Wno-subobject-linkage>,-Wshadow>
        $<$<CXX_COMPILER_ID:GNU>:-Wduplicated-cond -Wlogical-op -Wsuggest-override>
        $<$<CXX_COMPILER_ID:Clang>:-Wthread-safety -Winconsistent-missing-override
            -Wreserved-identifier>)
endif()

# Programs find the libraries that are installed with them, wherever that is.
cmake_path(RELATIVE_PATH CMAKE_INSTALL_FULL_LIBDIR
    BASE_DIRECTORY ${CMAKE_INSTALL_FULL_BINDIR} OUTPUT_VARIABLE libdir_from_bindir)
set(CMAKE_INSTALL_RPATH $ORIGIN/${libdir_from_bindir})
