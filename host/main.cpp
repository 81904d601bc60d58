#include <fcntl.h>
#include <langinfo.h>
#include <malloc.h>
#include <unistd.h>

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

// What is opened later must not be taken for a standard stream that is closed. Using one fails as
// it did: the place of each is held the wrong way round.
void holdPlacesOfStandardStreams() {
    for (const int stream : {STDIN_FILENO, STDOUT_FILENO, STDERR_FILENO}) {
        const bool isClosed = ::fcntl(stream, F_GETFD) < 0;
        if (isClosed) ::open("/dev/null", stream == STDIN_FILENO ? O_WRONLY : O_RDONLY);
    }
}

// What the loading of a large file has used for a while is joined as it is given back, rather than
// all at once by the next command that needs a large block: that took a second of a million keys.
void giveMemoryBackAtOnce() {
#ifdef __GLIBC__
    ::mallopt(M_MXFAST, 0);
#endif
}

}  // namespace

int main(int argc, char** argv) {
    holdPlacesOfStandardStreams();
    // A reader of the answers that goes away ends the session, not the process.
    std::signal(SIGPIPE, SIG_IGN);
    std::ios::sync_with_stdio(false);
    useUtf8();
    giveMemoryBackAtOnce();
    try {
        const std::vector<std::string> arguments(argv + (argc > 0 ? 1 : 0), argv + argc);
        return static_cast<int>(velkor::host::runProgram(arguments));
    } catch (const std::exception& error) {
        std::cerr << "velkor-config: " << error.what() << '\n';
        return static_cast<int>(velkor::host::ExitCode::commandFailed);
    }
}
