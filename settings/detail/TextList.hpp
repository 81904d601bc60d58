#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "framework/common/Export.hpp"
#include "settings/Converted.hpp"

namespace velkor::settings::detail {

/// The elements of a list in a text: separated by commas, without the blanks around them. One that
/// begins with a quotation mark ends at the next; in between, `\"` and `\\` stand for the second
/// character, everything else for itself. A blank text is a list of nothing. Refused with
/// "element 2: " and "empty; an empty text is written \"\"", "its quotation mark is not closed",
/// "a backslash in quotation marks before neither of \" and \\" or "something behind its closing
/// quotation mark". Takes time in proportion to the text's length.
VELKOR_EXPORT Converted<std::vector<std::string>> splitList(std::string_view text);

/// `elements` as a text that `splitList` takes apart again. What needs no quotation marks has none.
VELKOR_EXPORT std::string joinList(const std::vector<std::string>& elements);

/// "element 2: " and the reason, for the second element, whose `index` is 1.
VELKOR_EXPORT Reason ofElement(std::size_t index, const Reason& reason);

}  // namespace velkor::settings::detail
