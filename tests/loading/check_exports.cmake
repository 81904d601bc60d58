# Fails when LIBRARY exports anything but the names of this project. Shared objects that export
# inline variables of other libraries' templates can't be unloaded any more.
#
#     cmake -DNM=<nm> -DLIBRARY=<file> -P check_exports.cmake
execute_process(COMMAND ${NM} -D --defined-only --format=posix ${LIBRARY}
    OUTPUT_VARIABLE symbols COMMAND_ERROR_IS_FATAL ANY)
string(REGEX REPLACE "\n$" "" symbols "${symbols}")
string(REPLACE "\n" ";" symbols "${symbols}")
set(exported 0)
foreach(symbol IN LISTS symbols)
    string(REGEX MATCH "^[^ ]+ ([^ ]+)" symbol "${symbol}")
    set(kind ${CMAKE_MATCH_1})
    if(kind STREQUAL "A")
        continue()  # the version's own name
    endif()
    if(kind STREQUAL "u" OR NOT symbol MATCHES "^_Z(N|NK|TVN|TIN|TSN|Th[a-z0-9_]*NK?)6velkor")
        message(SEND_ERROR "exported, but not part of the interface: ${symbol}")
    endif()
    math(EXPR exported "${exported} + 1")
endforeach()
if(exported EQUAL 0)
    message(SEND_ERROR "${LIBRARY} exports nothing at all")
endif()
