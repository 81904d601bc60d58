#pragma once

#include <cstddef>
#include <functional>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "host/console/CommandRegistry.hpp"

namespace velkor::host {

/// How the word before the cursor may go on.
struct Completion {
    std::size_t typedBytes = 0;        ///< The length of what is there of the word.
    std::vector<std::string> words{};  ///< Whole words as one would type them; each begins with it.

    /// What all the words go on with after what is typed. Ends between two characters.
    std::string commonAddition() const;
};

/// Completes command names (first word, full and short), and what follows them as the command's
/// usage says: options, where a dash was typed, their values, and arguments, the first of which the
/// command may suggest itself.
class Completer {
public:
    /// What an argument with the given name may be that begins with the given text, and perhaps
    /// more.
    using ArgumentWords =
        std::function<std::vector<std::string>(std::string_view name, const std::string& typed)>;

    Completer(std::shared_ptr<const CommandRegistry> registry, ArgumentWords argumentWords);

    /// How `line`, all that stands before the cursor, may go on. No words when nothing fits, and
    /// inside quotes.
    Completion complete(std::string_view line) const;

private:
    std::vector<std::string> candidates(const std::vector<std::string>& wordsBefore,
                                        const std::string& typed) const;
    std::vector<std::string> argumentCandidates(const Command& command,
                                                const std::vector<std::string>& wordsBefore,
                                                const std::string& typed) const;

    std::shared_ptr<const CommandRegistry> registry;
    ArgumentWords argumentWords;
};

}  // namespace velkor::host
