#include "host/console/OptionWords.hpp"

#include <utility>

#include "host/console/Command.hpp"
#include "host/console/CommandLine.hpp"
#include "host/console/CommandUsage.hpp"

namespace velkor::host {

namespace {

constexpr const char* optionsEnd = "--";

Word readWord(const std::string& typed) {
    CommandLine line(typed);
    auto text = line.nextWord();
    return {std::move(text).value_or(""), line.wordIsQuoted()};
}

bool isOption(const Word& word) {
    return !word.isQuoted && word.text.compare(0, 2, optionsEnd) == 0;
}

}  // namespace

OptionWords::OptionWords(const std::string& name, const std::string& usageText, std::size_t least,
                         const std::vector<std::string>& typed) {
    const CommandUsage usage(usageText);
    bool optionsMayFollow = true;
    for (auto next = typed.begin(); next != typed.end(); ++next) {
        Word word = readWord(*next);
        if (!optionsMayFollow || !isOption(word)) {
            arguments.push_back(std::move(word));
            continue;
        }
        optionsMayFollow = word.text != optionsEnd;
        if (!optionsMayFollow) continue;
        const auto* const option = usage.find(word.text);
        if (option == nullptr) {
            throw CommandError(name + " knows no option " + word.text +
                               "; quote it where it is an ordinary word.");
        }
        std::string& value = options[word.text];
        if (option->valueName.empty()) continue;
        if (++next == typed.end()) {
            throw CommandError(name + ": " + word.text + " needs " + option->valueName + '.');
        }
        value = readWord(*next).text;
    }
    const bool tooMany = !usage.lastRepeats && arguments.size() > usage.arguments.size();
    if (tooMany || arguments.size() < least) throw CommandError(name + " takes " + usageText);
}

std::vector<std::string> OptionWords::texts() const {
    std::vector<std::string> texts;
    texts.reserve(arguments.size());
    for (const Word& word : arguments) texts.push_back(word.text);
    return texts;
}

std::optional<std::string> OptionWords::value(const std::string& option) const {
    const auto found = options.find(option);
    if (found == options.end()) return std::nullopt;
    return found->second;
}

}  // namespace velkor::host
