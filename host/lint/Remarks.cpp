#include "host/lint/Remarks.hpp"

namespace velkor::host {

namespace {

using configuration::PropertyFlaw;
using configuration::PropertyRemark;

std::string textOf(const PropertyRemark& remark) {
    switch (remark.flaw) {
        case PropertyFlaw::byteOrderMark:
            return "The byte order mark becomes a part of the first key.";
        case PropertyFlaw::notUtf8:
            return "The line holds bytes that are not UTF-8.";
        case PropertyFlaw::noSeparator:
            return "The line has no separator: its key goes on in the next line.";
        case PropertyFlaw::droppedLine:
            return "The last line has no value and no end: it is left out.";
        case PropertyFlaw::section:
            return "There are no sections: this begins a key.";
        case PropertyFlaw::indented:
            return "The line begins with a blank: it is a value of the empty key.";
        case PropertyFlaw::shortEscape:
            return "No four hexadecimal digits follow \\u: four bytes are taken for them.";
        case PropertyFlaw::surrogate:
            return "Half a character (a surrogate): write the whole character instead.";
        case PropertyFlaw::trailingBlanks:
            return "The blanks at the end are a part of the value.";
        case PropertyFlaw::backslashAtEnd:
            return "Nothing follows the last backslash: the line is left out.";
        case PropertyFlaw::sameKey:
            return "The key is in line " + std::to_string(remark.firstLine) +
                   " already: the last one counts.";
        case PropertyFlaw::droppedValue:
            return "The last line has no key and no end: it is left out.";
    }
    return "";
}

}  // namespace

std::string remarkText(const std::string& path, const PropertyRemark& remark) {
    return path + ':' + std::to_string(remark.line) + ':' + std::to_string(remark.column) + ": " +
           textOf(remark);
}

std::size_t countRemarks(const std::string& text) {
    std::size_t count = 0;
    configuration::lintProperties({text}, [&](const PropertyRemark&) { ++count; });
    return count;
}

std::string remarksNotice(const std::string& path, std::size_t count) {
    return path + ": " + remarksText(count) + ", see check";
}

std::string remarksText(std::size_t count) {
    return std::to_string(count) + (count == 1 ? " remark" : " remarks");
}

}  // namespace velkor::host
