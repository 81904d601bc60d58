#pragma once

#include <cstddef>
#include <functional>

#include "configuration/sources/PropertyFileSource.hpp"
#include "framework/common/Export.hpp"

namespace velkor::configuration {

/// What a property file can hold that is read otherwise than its author is likely to mean it.
enum class PropertyFlaw {
    byteOrderMark,   ///< It becomes a part of the first key.
    notUtf8,         ///< The line holds bytes that are no UTF-8; they are kept.
    noSeparator,     ///< The key of the line goes on in the next one.
    droppedLine,     ///< The last line has no value and no end: it is left out.
    section,         ///< `[name]` is no section but a key, or the beginning of one.
    indented,        ///< A line that begins with a blank is the value of the empty key.
    shortEscape,     ///< No four hexadecimal digits follow `\u`; four bytes are taken all the same.
    surrogate,       ///< `\uD800` to `\uDFFF`, half a character; it becomes no UTF-8.
    trailingBlanks,  ///< The blanks at the end of the value are a part of it.
    backslashAtEnd,  ///< Nothing follows the last backslash: the line is left out.
    sameKey,         ///< An earlier line has the same key, and doesn't count.
    droppedValue     ///< The last line has no key and no end: it is left out.
};

/// One flaw of a property file.
struct PropertyRemark {
    PropertyFlaw flaw;
    std::size_t line;       ///< From 1 on. A line ends at a line feed, a carriage return, or both.
    std::size_t column;     ///< From 1 on, in characters (code points).
    std::size_t firstLine;  ///< Of the same key: the first line that has it; else 0.
};

/// Calls `remark` with each flaw of `text`, in the order of their places, once the parser has read
/// all of it; what it throws passes on. Nothing of a file without flaws is remarked upon. Needs
/// time and memory in proportion to the size of the text. Stateless.
VELKOR_EXPORT void lintProperties(PropertyText text,
                                  const std::function<void(const PropertyRemark&)>& remark);

}  // namespace velkor::configuration
