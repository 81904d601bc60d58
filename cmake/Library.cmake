# What a library of this project is: the function that declares one, and what installing it means.

set(package_dir ${CMAKE_INSTALL_LIBDIR}/cmake/velkor)
set(module_dir ${CMAKE_INSTALL_LIBDIR}/pkgconfig)

# The pkg-config modules find their prefix from where they lie, so that an installed tree can be
# moved.
cmake_path(RELATIVE_PATH CMAKE_INSTALL_PREFIX
    BASE_DIRECTORY ${CMAKE_INSTALL_FULL_LIBDIR}/pkgconfig OUTPUT_VARIABLE prefix_from_module)

# Declares the shared library velkor::<name>, whose sources and headers are those of the folder that
# calls this:
#
#     velkor_add_library(<name> [REQUIRED] [TESTED_PARTS]
#         SUMMARY <text>        one line for the pkg-config module velkor-<name>
#         NEEDS <need>...       what it needs of others: each the arguments of one find_package(),
#                               in quotes ("SQLite3 3.40")
#         PUBLIC <target>...    what it links, and so do its users; among PUBLIC and PRIVATE are the
#         PRIVATE <target>...   libraries of this project that it builds on (velkor::<other>)
#         PKG_CONFIG_LIBS <flag>...  what PUBLIC means to a user of pkg-config, without velkor::
#         SOURCES <file>...
#         HEADERS <file>...)    those that are installed
#
# A library whose needs are not met is an error if it is REQUIRED. Otherwise it is left out and
# configuring says so; whatever depends on it asks for if(TARGET velkor::<name>).
#
# With TESTED_PARTS its sources are compiled into the object library velkor-<name>-parts, which tests
# of what it keeps to itself link instead.
#
# It exports its own API only, has an ABI number of its own, and is installed as the component
# <name>: by `cmake --install --component`, as find_package(velkor COMPONENTS <name>), and as the
# pkg-config module velkor-<name>. The global property VELKOR_LIBRARIES lists the names of all.
function(velkor_add_library name)
    cmake_parse_arguments(PARSE_ARGV 1 ARG
        "REQUIRED;TESTED_PARTS" "SUMMARY" "NEEDS;PUBLIC;PRIVATE;PKG_CONFIG_LIBS;SOURCES;HEADERS")
    if(ARG_UNPARSED_ARGUMENTS)
        message(FATAL_ERROR "velkor_add_library(${name}): what is ${ARG_UNPARSED_ARGUMENTS}?")
    endif()
    velkor_find_needs(missing ARG)
    if(missing)
        list(JOIN missing ", " missing)
        message(NOTICE "velkor::${name} is left out, not found: ${missing}")
        return()
    endif()

    set(target velkor-${name})
    if(ARG_TESTED_PARTS)
        add_library(${target}-parts OBJECT ${ARG_SOURCES})
        velkor_compile_for_library(${target}-parts)
        set_target_properties(${target}-parts PROPERTIES POSITION_INDEPENDENT_CODE ON)
        target_link_libraries(${target}-parts
            PUBLIC ${ARG_PUBLIC} ${ARG_PRIVATE}
            PRIVATE velkor-build-options)
        set(ARG_SOURCES $<TARGET_OBJECTS:${target}-parts>)
    endif()
    add_library(${target} SHARED ${ARG_SOURCES})
    velkor_compile_for_library(${target})
    add_library(velkor::${name} ALIAS ${target})
    target_sources(${target} PUBLIC
        FILE_SET HEADERS BASE_DIRS ${PROJECT_SOURCE_DIR} FILES ${ARG_HEADERS})
    string(MAKE_C_IDENTIFIER ${name} version_name)
    string(TOUPPER ${version_name} version_name)
    set(script ${CMAKE_CURRENT_BINARY_DIR}/exports.map)
    configure_file(${CMAKE_CURRENT_FUNCTION_LIST_DIR}/exports.map.in ${script} @ONLY)
    set_target_properties(${target} PROPERTIES
        EXPORT_NAME ${name}
        VERSION ${PROJECT_VERSION}
        SOVERSION ${PROJECT_VERSION_MAJOR}
        INSTALL_RPATH $ORIGIN
        LINKER_LANGUAGE CXX
        LINK_DEPENDS ${script})
    target_compile_features(${target} PUBLIC cxx_std_17)
    target_link_options(${target} PRIVATE
        LINKER:--version-script=${script} LINKER:--no-undefined-version)
    target_link_libraries(${target}
        PUBLIC ${ARG_PUBLIC}
        PRIVATE ${ARG_PRIVATE} $<BUILD_INTERFACE:velkor-build-options>)
    set_property(GLOBAL APPEND PROPERTY VELKOR_LIBRARIES ${name})
    if(ARG_REQUIRED)
        set_property(GLOBAL APPEND PROPERTY VELKOR_REQUIRED_LIBRARIES ${name})
    endif()
    if(VELKOR_INSTALL)
        velkor_install_library(${name} ARG)
    endif()
endfunction()

# How the sources of a library are compiled.
function(velkor_compile_for_library target)
    set_target_properties(${target} PROPERTIES
        CXX_EXTENSIONS OFF
        CXX_VISIBILITY_PRESET hidden
        VISIBILITY_INLINES_HIDDEN ON)
    # A call within the library goes straight to its target, so that it can be inlined.
    target_compile_options(${target} PRIVATE -fno-semantic-interposition)
endfunction()

# The names of this project's libraries among `targets`.
function(velkor_own_libraries result)
    list(FILTER ARGN INCLUDE REGEX "^velkor::")
    list(TRANSFORM ARGN REPLACE "^velkor::" "")
    set(${result} ${ARGN} PARENT_SCOPE)
endfunction()

# Finds what the arguments parsed as `prefix` of velkor_add_library() need; `result` lists what is
# missing. Of a required library CMake itself says what, and ends.
function(velkor_find_needs result prefix)
    set(mode QUIET)
    if(${prefix}_REQUIRED)
        set(mode REQUIRED)
    endif()
    set(missing)
    foreach(need IN LISTS ${prefix}_NEEDS)
        separate_arguments(arguments UNIX_COMMAND "${need}")
        list(POP_FRONT arguments package)
        find_package(${package} ${arguments} ${mode} GLOBAL)
        if(NOT ${package}_FOUND)
            list(APPEND missing "${need}")
        endif()
    endforeach()
    velkor_own_libraries(own ${${prefix}_PUBLIC} ${${prefix}_PRIVATE})
    foreach(library IN LISTS own)
        if(NOT TARGET velkor::${library})
            list(APPEND missing velkor::${library})
        endif()
    endforeach()
    set(${result} ${missing} PARENT_SCOPE)
endfunction()

# Installs velkor::<name>, declared with the arguments parsed as `prefix`, as a component.
function(velkor_install_library name prefix)
    install(TARGETS velkor-${name} EXPORT velkor-${name}-targets
        LIBRARY COMPONENT ${name}
        FILE_SET HEADERS DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}/velkor COMPONENT ${name}
        INCLUDES DESTINATION ${CMAKE_INSTALL_INCLUDEDIR}/velkor)
    install(EXPORT velkor-${name}-targets NAMESPACE velkor:: DESTINATION ${package_dir}
        COMPONENT ${name})

    set(needs ${${prefix}_NEEDS})
    velkor_own_libraries(libraries ${${prefix}_PUBLIC} ${${prefix}_PRIVATE})
    set(facts ${CMAKE_CURRENT_BINARY_DIR}/velkor-${name}.cmake)
    configure_file(
        ${CMAKE_CURRENT_FUNCTION_LIST_DIR}/velkor-component.cmake.in ${facts} @ONLY)
    install(FILES ${facts} DESTINATION ${package_dir} COMPONENT ${name})

    set(summary ${${prefix}_SUMMARY})
    list(TRANSFORM libraries PREPEND velkor- OUTPUT_VARIABLE modules)
    list(JOIN modules " " modules)
    list(JOIN ${prefix}_PKG_CONFIG_LIBS " " libs)
    set(module ${CMAKE_CURRENT_BINARY_DIR}/velkor-${name}.pc)
    configure_file(${CMAKE_CURRENT_FUNCTION_LIST_DIR}/velkor-component.pc.in ${module} @ONLY)
    install(FILES ${module} DESTINATION ${module_dir} COMPONENT ${name})
endfunction()
