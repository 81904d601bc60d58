#include "host/console/Completer.hpp"

#include <algorithm>
#include <utility>

#include "host/TerminalText.hpp"
#include "host/console/CommandLine.hpp"

namespace velkor::host {

namespace {

struct TypedLine {
    std::vector<std::string> wordsBefore;
    std::string_view lastWord;  ///< As typed; empty when the next word has not been begun.
};

TypedLine split(std::string_view line) {
    TypedLine typed;
    CommandLine words(line);
    try {
        while (auto word = words.nextWord()) {
            if (words.atEnd()) {
                typed.lastWord = line.substr(words.wordStart());
                break;
            }
            typed.wordsBefore.push_back(*std::move(word));
        }
    } catch (const CommandLineError&) {
        typed.lastWord = line.substr(words.wordStart());
    }
    return typed;
}

bool begins(std::string_view beginning, std::string_view text) {
    return text.substr(0, beginning.size()) == beginning;
}

}  // namespace

std::string Completion::commonAddition() const {
    if (words.empty()) return "";
    std::string common = words.front();
    for (const auto& word : words) {
        const auto end =
            std::mismatch(common.begin(), common.end(), word.begin(), word.end()).first;
        common.erase(end, common.end());
    }
    std::size_t length = common.size();
    while (length > typedBytes && length < words.front().size() &&
           isContinuationByte(words.front()[length])) {
        --length;
    }
    return common.substr(typedBytes, length - typedBytes);
}

Completer::Completer(std::shared_ptr<const CommandRegistry> commandRegistry, Words currentKeys)
    : registry(std::move(commandRegistry)), keys(std::move(currentKeys)) {}

Completion Completer::complete(std::string_view line) const {
    const TypedLine typed = split(line);
    Completion completion{typed.lastWord.size()};
    for (const auto& candidate : candidates(typed.wordsBefore)) {
        std::string word = quotedWord(candidate);
        if (begins(typed.lastWord, word)) completion.words.push_back(std::move(word));
    }
    return completion;
}

std::vector<std::string> Completer::candidates(const std::vector<std::string>& wordsBefore) const {
    if (wordsBefore.empty()) return registry->names();
    if (wordsBefore.size() > 1) return {};
    try {
        const auto command = registry->find(wordsBefore.front());
        if (!command->takesArguments()) return {};
        return command->suggestions() ? command->suggestions()() : keys();
    } catch (const CommandError&) {
        return {};
    }
}

}  // namespace velkor::host
