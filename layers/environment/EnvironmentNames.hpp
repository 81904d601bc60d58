#pragma once

#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "framework/common/Export.hpp"

namespace velkor::layers {

/// Which environment variables stand for keys, and for which: the rule, in both directions.
///
/// A name stands for a key when it is the prefix followed by one or more of the characters A to Z,
/// 0 to 9 and "_"; every other variable is no business of the rule. What follows the prefix is
/// read from left to right:
///
/// - "__" is ".";
/// - a "_" that is left over is "_", so that "___" is "._", and "____" is "..";
/// - A to Z become lower case, digits stay.
///
/// With the prefix "VELKOR_", VELKOR_SERVER__MAX_SIZE is server.max_size, VELKOR_A__ is "a." and
/// VELKOR_ alone, VELKOR_Port and velkor_PORT are nothing.
///
/// Keys that are spelled otherwise are listed. The name of a listed key is the prefix and the key
/// with "__" for each ".", A to Z for a to z, and "_" for each byte that is no letter of ASCII, no
/// digit and no ".": with mail.replyTo and log-level in the list, VELKOR_MAIL__REPLYTO is
/// mail.replyTo and VELKOR_LOG_LEVEL is log-level (and log_level can't be named then).
///
/// Each name stands for one key at most, and no two names for the same one: `nameOf` inverts
/// `keyOf`. Without a list, those keys can be named that consist of a to z, 0 to 9, "_" and ".",
/// and where neither "_" nor "." follows a "_".
///
/// Immutable: safe for concurrent use.
class VELKOR_EXPORT EnvironmentNames {
public:
    /// The rule for names that begin with `prefix`, taken as it is: an underscore that is to
    /// separate it from the rest belongs to it. Throws `std::invalid_argument` "Environment
    /// variable NAME stands for two keys: FIRST, SECOND" when two of the `spelledKeys` have the
    /// same name.
    explicit EnvironmentNames(std::string prefix, const std::vector<std::string>& spelledKeys = {});

    /// The key that the variable called `name` stands for; nothing when it stands for none.
    std::optional<std::string> keyOf(std::string_view name) const;

    /// The name of the variable that stands for `key`; nothing when none does.
    std::optional<std::string> nameOf(const std::string& key) const;

private:
    std::string nameFor(const std::string& key) const;

    std::string prefix;
    std::map<std::string, std::string, std::less<>> spelled;  ///< The listed keys by their names.
};

}  // namespace velkor::layers
