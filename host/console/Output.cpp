#include "host/console/Output.hpp"

#include <cerrno>

#include "host/TerminalText.hpp"
#include "host/console/Interruption.hpp"

namespace velkor::host {

namespace {

std::string paintedLines(std::string_view text, Paint paint) {
    std::string lines;
    while (!text.empty()) {
        const std::size_t end = text.find('\n');
        lines += paint(text.substr(0, end)) + '\n';
        text.remove_prefix(end + 1);
    }
    return lines;
}

// What is shown of `text`; nothing when that is the text itself, which may be long.
std::string shownCopy(std::string_view text, Output::Answers form, Paint paint) {
    const bool isComplete = text.back() == '\n';
    if (isComplete && form == Output::Answers::exact) return "";
    std::string copy = form == Output::Answers::exact ? std::string(text)
                                                      : escapedForTerminal(text, LineFeeds::kept);
    if (!isComplete) copy += '\n';
    return form == Output::Answers::coloured && paint != nullptr ? paintedLines(copy, paint) : copy;
}

}  // namespace

Output::Output(std::ostream& answerStream, Answers answerForm, std::ostream& messageStream)
    : answers(answerStream), messages(messageStream), form(answerForm) {}

void Output::answer(std::string_view text, Paint paint) {
    if (text.empty()) return;
    const std::string copy = shownCopy(text, form, paint);
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
