# Writes PAGE_OUTPUT, C++ that holds the page in pieces: run with -D PAGE_FOLDER, PAGE_SCRIPTS (in
# their order), PAGE_OUTPUT. Style and script are pieces of their own, which the page's policy names
# by their digests.
file(READ ${PAGE_FOLDER}/index.html markup)
file(READ ${PAGE_FOLDER}/page.css style)
set(script)
foreach(name IN LISTS PAGE_SCRIPTS)
    file(READ ${PAGE_FOLDER}/${name} part)
    string(APPEND script "${part}\n")
endforeach()

string(FIND "${markup}" "</style>" style_end)
string(FIND "${markup}" "</script>" script_end)
math(EXPR between "${script_end} - ${style_end}")
string(SUBSTRING "${markup}" 0 ${style_end} head)
string(SUBSTRING "${markup}" ${style_end} ${between} body)
string(SUBSTRING "${markup}" ${script_end} -1 tail)

set(text "#include \"http/detail/routes/PageText.hpp\"\n\nnamespace velkor::http::detail {\n")
foreach(piece head style body script tail)
    string(SUBSTRING ${piece} 0 1 first)
    string(TOUPPER ${first} first)
    string(SUBSTRING ${piece} 1 -1 rest)
    string(APPEND text "\nconst std::string_view page${first}${rest} = R\"page(${${piece}})page\";\n")
endforeach()
string(APPEND text "\n}  // namespace velkor::http::detail\n")
file(WRITE ${PAGE_OUTPUT} "${text}")
