#include "host/console/Command.hpp"

#include <cstdint>
#include <limits>
#include <utility>

namespace velkor::host {

namespace {

// A descriptor can't say more than this, so it stands for "as many as you like".
constexpr auto unlimited = std::numeric_limits<std::uint8_t>::max();

std::string counted(unsigned count) {
    if (count == 0) return "no arguments";
    return std::to_string(count) + (count == 1 ? " argument" : " arguments");
}

/// An answer that nobody sees before it is complete.
class CollectedAnswer final : public CommandOutput {
public:
    void line(std::string_view added) override { text.append(added) += '\n'; }
    void note(std::string_view) override {}

    std::string text;
};

}  // namespace

std::string_view Command::shortName() const noexcept {
    const std::string_view full = name();
    const std::size_t dot = full.rfind('.');
    return dot == std::string_view::npos ? full : full.substr(dot + 1);
}

std::string Command::argumentText() const {
    return traits.arguments.empty() ? limits() : traits.arguments;
}

CommandUsage Command::usage() const {
    const unsigned most = descriptor.maximumArguments;
    const bool isUnknown = traits.arguments.empty() && most > 0 && most != unlimited;
    return CommandUsage(isUnknown ? "KEY" : std::string_view(traits.arguments));
}

std::vector<std::string> Command::readArguments(CommandLine& line) const {
    std::vector<std::string> arguments;
    while (!traits.takesRawRest || arguments.size() + 1 < descriptor.maximumArguments) {
        auto word = line.nextWord();
        if (!word) return arguments;
        arguments.push_back(traits.takesWordsAsTyped ? std::string(line.typedWord())
                                                     : *std::move(word));
    }
    const std::string_view rest = line.takeRest();
    if (!rest.empty()) arguments.emplace_back(rest);
    return arguments;
}

std::vector<std::string> Command::givenArguments(std::vector<std::string> words) const {
    if (traits.takesWordsAsTyped) {
        for (auto& word : words) word = quotedWord(word);
    }
    const std::size_t most = descriptor.maximumArguments;
    if (!traits.takesRawRest || words.size() <= most) return words;
    std::string& rest = words[most - 1];
    for (std::size_t next = most; next < words.size(); ++next) rest += ' ' + words[next];
    words.resize(most);
    return words;
}

std::string Command::run(std::vector<std::string>&& arguments, CommandOutput& output) const {
    const std::size_t count = arguments.size();
    const bool tooMany =
        descriptor.maximumArguments != unlimited && count > descriptor.maximumArguments;
    if (count < descriptor.minimumArguments || tooMany) {
        throw CommandError(name() + " takes " + limits() + "; given: " + std::to_string(count));
    }
    if (traits.stream == nullptr) return descriptor.handler(std::move(arguments));
    traits.stream(std::move(arguments), output);
    return "";
}

std::string Command::run(std::vector<std::string>&& arguments) const {
    CollectedAnswer collected;
    const std::string answer = run(std::move(arguments), collected);
    return collected.text + answer;
}

std::string Command::limits() const {
    const unsigned least = descriptor.minimumArguments;
    const unsigned most = descriptor.maximumArguments;
    if (least == most) return counted(most);
    if (most == unlimited) {
        return least == 0 ? "any number of arguments" : "at least " + counted(least);
    }
    if (least == 0) return "at most " + counted(most);
    return std::to_string(least) + " to " + counted(most);
}

}  // namespace velkor::host
