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

/// Completes command names (first word, full and short), and the first argument of a command: keys,
/// or what the command suggests itself.
class Completer {
public:
    using Words = std::function<std::vector<std::string>()>;

    /// `keys` gives the keys that there are now.
    Completer(std::shared_ptr<const CommandRegistry> registry, Words keys);

    /// How `line`, all that stands before the cursor, may go on. No words when nothing fits, and
    /// inside quotes.
    Completion complete(std::string_view line) const;

private:
    std::vector<std::string> candidates(const std::vector<std::string>& wordsBefore) const;

    std::shared_ptr<const CommandRegistry> registry;
    Words keys;
};

}  // namespace velkor::host
