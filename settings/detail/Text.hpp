#pragma once

#include <string>
#include <string_view>

#include "configuration/ConfigurationValue.hpp"
#include "framework/common/Export.hpp"
#include "settings/Converted.hpp"

namespace velkor::settings::detail {

/// The text form of a single value, from which every other conversion reads: truth values as "true"
/// and "false", numbers as `showNumber` writes them, narrow text byte for byte, UTF-16 text as
/// UTF-8. Refused with "a list, where one value is wanted" and "ill-formed UTF-16".
VELKOR_EXPORT Converted<std::string> textOf(const configuration::ConfigurationValue& value);

/// The same in UTF-16: UTF-16 text unit by unit, also if it is ill-formed. Of narrow text refused
/// with "ill-formed UTF-8".
VELKOR_EXPORT Converted<std::u16string> utf16Of(const configuration::ConfigurationValue& value);

/// `text` as UTF-8. A lone surrogate becomes U+FFFD.
VELKOR_EXPORT std::string utf8(const std::u16string& text);

/// `text` without the ASCII blanks (space, \t, \n, \v, \f, \r) at its ends.
VELKOR_EXPORT std::string_view trimmed(std::string_view text) noexcept;

/// Whether the texts are the same but for the case of ASCII letters.
VELKOR_EXPORT bool sameIgnoringCase(std::string_view left, std::string_view right) noexcept;

/// Whether `value` is a text of nothing at all, or, with `blanksCount` false, of blanks only.
VELKOR_EXPORT bool isEmptyText(const configuration::ConfigurationValue& value, bool blanksCount);

}  // namespace velkor::settings::detail
