#include "host/console/Output.hpp"

#include <cerrno>

#include "host/TerminalText.hpp"

namespace velkor::host {

Output::Output(std::ostream& answerStream, Answers answerForm, std::ostream& messageStream)
    : answers(answerStream), messages(messageStream), form(answerForm) {}

void Output::answer(std::string_view text) {
    if (text.empty()) return;
    const common::MutexLock lock(mutex);
    if (error != 0) return;
    errno = 0;
    if (form == Answers::escaped) {
        answers << escapedForTerminal(text, LineFeeds::kept);
    } else {
        answers << text;
    }
    if (text.back() != '\n') answers << '\n';
    if (!answers.flush()) error = errno == 0 ? EIO : errno;
}

void Output::message(std::string_view text) {
    const std::string line =
        "velkor-config: " + escapedForTerminal(text, LineFeeds::escaped) + '\n';
    const common::MutexLock lock(mutex);
    messages << line << std::flush;
}

bool Output::isOpen() const {
    return failure() == 0;
}

int Output::failure() const {
    const common::MutexLock lock(mutex);
    return error;
}

}  // namespace velkor::host
