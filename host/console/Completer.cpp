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

// The text of a word that is typed so far; where it is not finished, what is typed.
std::string meaningOf(std::string_view lastWord) {
    CommandLine words(lastWord);
    try {
        return words.nextWord().value_or("");
    } catch (const CommandLineError&) {
        return std::string(lastWord);
    }
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

Completer::Completer(std::shared_ptr<const CommandRegistry> commandRegistry,
                     ArgumentWords wordsOfArguments)
    : registry(std::move(commandRegistry)), argumentWords(std::move(wordsOfArguments)) {}

Completion Completer::complete(std::string_view line) const {
    const TypedLine typed = split(line);
    Completion completion{typed.lastWord.size()};
    for (const auto& candidate : candidates(typed.wordsBefore, meaningOf(typed.lastWord))) {
        std::string word = quotedWord(candidate);
        if (begins(typed.lastWord, word)) completion.words.push_back(std::move(word));
    }
    return completion;
}

std::vector<std::string> Completer::candidates(const std::vector<std::string>& wordsBefore,
                                               const std::string& typed) const {
    if (wordsBefore.empty()) return registry->names();
    try {
        return argumentCandidates(*registry->find(wordsBefore.front()), wordsBefore, typed);
    } catch (const CommandError&) {
        return {};
    }
}

std::vector<std::string> Completer::argumentCandidates(const Command& command,
                                                       const std::vector<std::string>& wordsBefore,
                                                       const std::string& typed) const {
    const CommandUsage usage = command.usage();
    std::size_t index = 0;
    for (auto word = wordsBefore.begin() + 1; word != wordsBefore.end(); ++word) {
        const auto* const option = usage.find(*word);
        if (option == nullptr) {
            ++index;
        } else if (!option->valueName.empty() && ++word == wordsBefore.end()) {
            return argumentWords(option->valueName, typed);
        }
    }
    std::vector<std::string> words;
    if (index == 0 && command.suggestions()) {
        words = command.suggestions()();
    } else {
        words = argumentWords(usage.argumentName(index), typed);
    }
    if (begins("-", typed)) {
        for (const auto& option : usage.options) words.push_back(option.name);
    }
    return words;
}

}  // namespace velkor::host
