#pragma once

#include <map>
#include <optional>
#include <string>
#include <vector>

namespace velkor::host {

/// A word of a command line.
struct Word {
    std::string text;
    bool isQuoted = false;  ///< A quote or a backslash was in it.
};

/// The arguments of a command that has options, which may stand anywhere among them: a word that
/// begins with "--" and is not quoted. Behind a "--" by itself no word is an option.
class OptionWords {
public:
    /// Reads `typed`, the words as they were typed, as arguments of the command `name`, which takes
    /// what `usage` says, see `CommandUsage`.
    ///
    /// Throws `CommandError` "NAME knows no option --x; quote it where it is an ordinary word.",
    /// "NAME: --x needs T." with the name of its value, and where there are more words than
    /// arguments, or fewer than `least`, "NAME takes " and the usage.
    OptionWords(const std::string& name, const std::string& usage, std::size_t least,
                const std::vector<std::string>& typed);

    /// The words that are no options.
    const std::vector<Word>& words() const noexcept { return arguments; }

    /// Their texts.
    std::vector<std::string> texts() const;

    /// Whether the option was given.
    bool has(const std::string& option) const { return options.count(option) != 0; }

    /// The value of the option; of several the last one. Nothing when it was not given.
    std::optional<std::string> value(const std::string& option) const;

private:
    std::vector<Word> arguments;
    std::map<std::string, std::string> options;
};

}  // namespace velkor::host
