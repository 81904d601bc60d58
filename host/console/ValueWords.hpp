#pragma once

#include <string>
#include <vector>

#include "configuration/ConfigurationValue.hpp"

namespace velkor::host {

/// The value of `word` taken as a whole: `true` and `false` are bool; digits are int, else unsigned
/// int, else double, if that holds exactly these; digits with a "." or an exponent are the nearest
/// double. Everything else is narrow text, such as "007", "10.20.0.9", "20s" and what no finite
/// double is near to.
configuration::ConfigurationValue wordValue(const std::string& word);

/// Whether `stored` is what somebody means who types `text`: the text itself, or the same truth
/// value or number as `wordValue`, whatever its kind.
bool isMeantBy(const std::string& text, const configuration::ConfigurationValue& stored);

/// `words` as a value of the kind that has the tag `type`: one word, or for an array any number.
/// What a word may be is what `settings::Conversion` reads of a text.
///
/// Throws `CommandError` "--type X: one of " and the tags for a type that there is none of; "--type
/// T: " and the reason where a word does not fit, with "word N: " in front of it for an array; and
/// "--type T: one VALUE is needed; given: N".
configuration::ConfigurationValue typedValue(const std::string& type,
                                             const std::vector<std::string>& words);

/// The tags of all kinds of values.
std::vector<std::string> typeNames();

}  // namespace velkor::host
