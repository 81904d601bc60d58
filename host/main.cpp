#include <langinfo.h>

#include <clocale>
#include <csignal>
#include <exception>
#include <iostream>
#include <string>
#include <string_view>
#include <vector>

#include "host/Program.hpp"

namespace {

// Keys and values are UTF-8, whatever the user's language. Numbers stay in the C locale.
void useUtf8() {
    const bool isUtf8 = std::setlocale(LC_CTYPE, "") != nullptr &&
                        std::string_view(nl_langinfo(CODESET)) == "UTF-8";
    if (!isUtf8) std::setlocale(LC_CTYPE, "C.UTF-8");
}

}  // namespace

int main(int argc, char** argv) {
    // A reader of the answers that goes away ends the session, not the process.
    std::signal(SIGPIPE, SIG_IGN);
    std::ios::sync_with_stdio(false);
    useUtf8();
    try {
        const std::vector<std::string> arguments(argv + (argc > 0 ? 1 : 0), argv + argc);
        return static_cast<int>(velkor::host::runProgram(arguments));
    } catch (const std::exception& error) {
        std::cerr << "velkor-config: " << error.what() << '\n';
        return static_cast<int>(velkor::host::ExitCode::commandFailed);
    }
}
