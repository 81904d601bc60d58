#include "host/console/CommandUsage.hpp"

#include <algorithm>
#include <optional>

namespace velkor::host {

namespace {

constexpr std::string_view optionMark = "--";
constexpr std::string_view repetition = "...";

/// One word of a usage text.
struct UsageWord {
    std::string_view name;
    bool closes = false;   ///< A bracket closes behind it.
    bool repeats = false;  ///< Dots follow it.
};

std::optional<UsageWord> takeWord(std::string_view& text) {
    const std::size_t begin = text.find_first_not_of(' ');
    if (begin == std::string_view::npos) return std::nullopt;
    text.remove_prefix(begin);
    std::string_view name = text.substr(0, text.find(' '));
    text.remove_prefix(name.size());
    name.remove_prefix(std::min(name.find_first_not_of('['), name.size()));
    UsageWord word;
    const std::size_t end = name.find_first_of("].");
    word.closes = name.find(']') != std::string_view::npos;
    word.repeats = name.find(repetition) != std::string_view::npos;
    word.name = name.substr(0, end);
    return word;
}

}  // namespace

CommandUsage::CommandUsage(std::string_view text) {
    while (const auto word = takeWord(text)) {
        if (word->name.substr(0, optionMark.size()) != optionMark) {
            arguments.emplace_back(word->name);
            lastRepeats = word->repeats;
            continue;
        }
        options.push_back({std::string(word->name)});
        if (word->closes) continue;
        if (const auto value = takeWord(text)) options.back().valueName = value->name;
    }
}

const CommandUsage::Option* CommandUsage::find(std::string_view name) const noexcept {
    const auto found = std::find_if(options.begin(), options.end(),
                                    [&](const Option& option) { return option.name == name; });
    return found == options.end() ? nullptr : &*found;
}

std::string_view CommandUsage::argumentName(std::size_t index) const noexcept {
    if (index < arguments.size()) return arguments[index];
    return lastRepeats ? std::string_view(arguments.back()) : std::string_view();
}

}  // namespace velkor::host
