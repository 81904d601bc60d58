# The page: `page_source` is the file, made at build time, that holds it.
set(page_scripts dom.js values.js api.js store.js follow.js grid.js form.js details.js page.js)
set(page_source ${CMAKE_CURRENT_BINARY_DIR}/PageText.cpp)
list(TRANSFORM page_scripts PREPEND ${CMAKE_CURRENT_LIST_DIR}/ OUTPUT_VARIABLE page_files)
add_custom_command(OUTPUT ${page_source}
    COMMAND ${CMAKE_COMMAND}
        -D PAGE_FOLDER=${CMAKE_CURRENT_LIST_DIR} -D "PAGE_SCRIPTS=${page_scripts}"
        -D PAGE_OUTPUT=${page_source} -P ${CMAKE_CURRENT_LIST_DIR}/embed.cmake
    DEPENDS
        ${page_files} ${CMAKE_CURRENT_LIST_DIR}/embed.cmake
        ${CMAKE_CURRENT_LIST_DIR}/index.html ${CMAKE_CURRENT_LIST_DIR}/page.css
    COMMENT "Putting the page together"
    VERBATIM)
