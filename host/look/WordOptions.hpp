#pragma once

#include <map>
#include <set>
#include <string>
#include <vector>

namespace velkor::host {

/// The words of a command, its options told from the rest.
struct WordOptions {
    std::vector<std::string> words{};
    std::set<std::string> flags{};                ///< Options without a value that were given.
    std::map<std::string, std::string> values{};  ///< Options with a value; the last one counts.

    bool has(const std::string& flag) const { return flags.count(flag) != 0; }
};

/// What a command understands.
struct KnownOptions {
    std::set<std::string> flags{};
    std::set<std::string> withValue{};
};

/// Tells the options among `arguments`, which begin with "--" and may stand anywhere in front of a
/// "--", from the words. Throws `CommandError` "Unknown option: " or "A value is needed behind: "
/// and the option.
WordOptions parseOptionsAmong(const std::vector<std::string>& arguments, const KnownOptions& known);

}  // namespace velkor::host
