#include "host/console/Output.hpp"

#include <cerrno>

#include "host/TerminalText.hpp"
#include "host/console/Interruption.hpp"

namespace velkor::host {

namespace {

// What is shown of `text`; nothing when that is the text itself, which may be long.
std::string shownCopy(std::string_view text, Output::Answers form) {
    const bool isComplete = text.back() == '\n';
    if (isComplete && form == Output::Answers::exact) return "";
    std::string copy = form == Output::Answers::escaped ? escapedForTerminal(text, LineFeeds::kept)
                                                        : std::string(text);
    if (!isComplete) copy += '\n';
    return copy;
}

}  // namespace

Output::Output(std::ostream& answerStream, Answers answerForm, std::ostream& messageStream)
    : answers(answerStream), messages(messageStream), form(answerForm) {}

void Output::answer(std::string_view text) {
    if (text.empty()) return;
    const std::string copy = shownCopy(text, form);
    const common::MutexLock lock(mutex);
    if (error != 0 || Interruption::isRequested()) return;
    errno = 0;
    if (answers << (copy.empty() ? text : copy) << std::flush) return;
    if (Interruption::isRequested()) {
        answers.clear();
    } else {
        error = errno == 0 ? EIO : errno;
    }
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
