#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace velkor::host {

/// What a command takes, read from the text that help shows of it, such as
/// "KEY [VALUE...] [--type T] [--dry-run]". The names tell what the words mean.
struct CommandUsage {
    struct Option {
        std::string name;         ///< With its dashes.
        std::string valueName{};  ///< Empty: the option has no value.
    };

    explicit CommandUsage(std::string_view text);

    /// The option called `name`; null when there is none. Lives as long as this.
    const Option* find(std::string_view name) const noexcept;

    /// The name of the argument with that index; empty when there is none.
    std::string_view argumentName(std::size_t index) const noexcept;

    std::vector<std::string> arguments{};
    bool lastRepeats = false;  ///< The last argument may come any number of times.
    std::vector<Option> options{};
};

}  // namespace velkor::host
