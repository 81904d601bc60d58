#include "configuration/sources/PropertyFileLint.hpp"

#include <algorithm>
#include <boost/locale/utf.hpp>
#include <cctype>
#include <map>
#include <string>
#include <string_view>
#include <vector>

#include "configuration/sources/PropertyFileParser.hpp"

namespace velkor::configuration {

namespace {

using State = PropertyFileParser::State;
using Step = PropertyFileParser::Step;

constexpr std::string_view byteOrderMark = "\xEF\xBB\xBF";

bool isLineBreak(char byte) {
    return byte == '\r' || byte == '\n';
}

bool isBlank(char byte) {
    return byte == ' ' || byte == '\t';
}

bool isHexadecimal(char byte) {
    return std::isxdigit(static_cast<unsigned char>(byte)) != 0;
}

bool isEscape(State state) {
    return state == State::keyEscape || state == State::valueEscape;
}

/// The line that begins at `begin`, without what ends it.
std::string_view lineAt(std::string_view text, std::size_t begin) {
    return text.substr(begin, text.find_first_of("\r\n", begin) - begin);
}

std::size_t sizeWithoutTrailingBlanks(std::string_view text) {
    while (!text.empty() && isBlank(text.back())) text.remove_suffix(1);
    return text.size();
}

/// A name in brackets, with nothing or a comment behind it.
bool isSection(std::string_view line) {
    if (line.empty() || line.front() != '[') return false;
    const std::size_t end = line.find(']');
    if (end == std::string_view::npos) return false;
    const std::size_t next = line.find_first_not_of(" \t", end + 1);
    if (next == std::string_view::npos || line[next] == '#' || line[next] == '!') return true;
    return line[next] == ';' && isBlank(line[next - 1]);  // elsewhere it is an ordinary byte
}

/// The size of the byte order mark at the beginning of `text`.
std::size_t markSize(std::string_view text) {
    return text.substr(0, byteOrderMark.size()) == byteOrderMark ? byteOrderMark.size() : 0;
}

/// Where the first byte stands that is no UTF-8; the size of `line` when all of it is.
std::size_t firstForeignByte(std::string_view line) {
    using Utf8 = boost::locale::utf::utf_traits<char>;
    const char* const end = line.data() + line.size();
    for (const char* at = line.data(); at != end;) {
        const char* const begin = at;
        if (!boost::locale::utf::is_valid_codepoint(Utf8::decode(at, end))) {
            return static_cast<std::size_t>(begin - line.data());
        }
    }
    return line.size();
}

struct Finding {
    std::size_t position;
    PropertyFlaw flaw;
    std::size_t firstLine;
};

/// The lines of a text, found from its beginning on.
class Lines {
public:
    explicit Lines(std::string_view wholeText) : text(wholeText) {}

    /// Goes on to `position`, which is not before the last one.
    void advanceTo(std::size_t position) {
        for (; at < position; ++at) advance();
    }

    std::size_t line() const { return number; }
    std::size_t column() const { return characters + 1; }

private:
    void advance() {
        const char byte = text[at];
        const bool ends = byte == '\n' || (byte == '\r' && text.substr(at + 1, 1) != "\n");
        if (ends) {
            ++number;
            characters = 0;
        } else if ((static_cast<unsigned char>(byte) & 0xC0U) != 0x80U) {
            ++characters;
        }
    }

    const std::string_view text;
    std::size_t at = 0;
    std::size_t number = 1;
    std::size_t characters = 0;  // of the line, up to there
};

/// Looks at what the parser does, step by step. All places are those in the file.
class Linter {
public:
    explicit Linter(std::string_view wholeText) : text(wholeText), lines(text) {}

    std::vector<Finding> findings() {
        if (markSize(text) != 0) add(0, PropertyFlaw::byteOrderMark);
        lookForForeignBytes();
        const TextTable table =
            PropertyFileParser(std::string(text), PropertyFileParser::Records::omitted)
                .parse([this](const Step& s) { observe(s); });
        atEnd();
        lookForSameKeys(table);
        std::stable_sort(found.begin(), found.end(), [](const Finding& a, const Finding& b) {
            return a.position < b.position;
        });
        return std::move(found);
    }

private:
    struct Place {
        std::size_t position;
        std::size_t line;
    };

    void add(std::size_t position, PropertyFlaw flaw, std::size_t firstLine = 0) {
        found.push_back({position, flaw, firstLine});
    }

    void lookForForeignBytes() {
        for (std::size_t begin = 0; begin < text.size();) {
            const std::string_view line = lineAt(text, begin);
            const std::size_t foreign = firstForeignByte(line);
            if (foreign != line.size()) add(begin + foreign, PropertyFlaw::notUtf8);
            begin += line.size() + 1;
        }
    }

    void observe(const Step& step) {
        last = step.to;
        if (isEscape(step.to)) backslash = step.end - 1;
        if (isEscape(step.from)) onEscaped(step);
        if (step.from == State::lineStart && step.to == State::key) onKeyBegin(step.begin);
        if (step.from == State::key) onKey(step);
        if (step.from == State::separator && step.to == State::value) onValueBegin();
        if (step.from == State::value) onValue(step);
    }

    void onKeyBegin(std::size_t position) {
        lines.advanceTo(position);
        key = {position, lines.line()};
        beginLine(position);
    }

    void beginLine(std::size_t position) {
        lineBegin = position;
        const std::size_t visible = position == 0 ? markSize(text) : position;
        inSection = isSection(lineAt(text, visible));
        if (inSection) add(visible, PropertyFlaw::section);
    }

    void onKey(const Step& step) {
        for (std::size_t at = step.begin; at < step.end; ++at) {
            if (isLineBreak(text[at])) onLineBreakInKey(at);
        }
        keyEnd = step.end - 1;
    }

    void onLineBreakInKey(std::size_t position) {
        const bool isEmpty = lineBegin == position;
        if (!isEmpty && !inSection) add(position, PropertyFlaw::noSeparator);
        beginLine(position + 1);
    }

    void onValueBegin() {
        const bool hasKey = keyEnd != key.position;
        if (!hasKey && isBlank(text[keyEnd])) add(key.position, PropertyFlaw::indented);
    }

    void onEscaped(const Step& step) {
        // No line is joined to a key: the line break becomes a part of it.
        if (step.from == State::keyEscape && isLineBreak(text[step.begin])) {
            onLineBreakInKey(step.begin);
        }
        if (text[step.begin] != 'u') return;
        const std::string_view digits = text.substr(step.begin + 1, step.end - step.begin - 1);
        constexpr std::size_t needed = 4;
        if (digits.size() < needed || !std::all_of(digits.begin(), digits.end(), isHexadecimal)) {
            add(step.begin - 1, PropertyFlaw::shortEscape);
        } else if ((digits[0] == 'd' || digits[0] == 'D') && digits[1] >= '8') {
            add(step.begin - 1, PropertyFlaw::surrogate);
        }
    }

    void onValue(const Step& step) {
        if (step.to == State::valueEscape) return;
        const bool isStored = step.to == State::lineStart;
        if (isStored) places.push_back(key);
        const std::string_view piece =
            text.substr(step.begin, step.end - step.begin - (isStored ? 1 : 0));
        const std::size_t size = sizeWithoutTrailingBlanks(piece);
        if (size < piece.size()) add(step.begin + size, PropertyFlaw::trailingBlanks);
    }

    void atEnd() {
        if (last == State::value) atEndInValue();
        if (isEscape(last) || last == State::continuationIndent) {
            add(backslash, PropertyFlaw::backslashAtEnd);
        } else if (last == State::key) {
            atEndInKey();
        } else if (last == State::separator && keyEnd != key.position) {
            add(text.size(), PropertyFlaw::droppedLine);
        }
    }

    void atEndInValue() {
        places.push_back(key);
        if (keyEnd == key.position) add(text.size(), PropertyFlaw::droppedValue);
    }

    void atEndInKey() {
        if (lineBegin < text.size()) {
            if (!inSection) add(text.size(), PropertyFlaw::droppedLine);
        } else if (found.back().flaw == PropertyFlaw::noSeparator) {  // or a section
            found.back().flaw = PropertyFlaw::droppedLine;
        }
    }

    // The parser's own table knows which property counts. The others of its key are rare.
    void lookForSameKeys(const TextTable& table) {
        std::map<std::size_t, std::vector<std::size_t>> repeated;
        for (std::size_t number = 0; number < table.size(); ++number) {
            const std::size_t counting = table.counting(number);
            const bool isIndented =
                table.key(number).empty() && isBlank(text[places[number].position]);
            if (counting != number && !isIndented) repeated[counting].push_back(number);
        }
        for (auto& [counting, numbers] : repeated) {
            numbers.push_back(counting);
            const std::size_t firstLine = places[numbers.front()].line;
            for (auto number = numbers.begin() + 1; number != numbers.end(); ++number) {
                add(places[*number].position, PropertyFlaw::sameKey, firstLine);
            }
        }
    }

    const std::string_view text;
    Lines lines;
    std::vector<Finding> found;
    std::vector<Place> places;  // where the keys of the properties begin
    Place key{0, 1};
    std::size_t keyEnd = 0;     // the byte that ended the key, or the last one of it
    std::size_t lineBegin = 0;  // of the line in the key that is being read
    bool inSection = false;     // it looks like a section
    std::size_t backslash = 0;  // the last one
    State last = State::lineStart;
};

}  // namespace

void lintProperties(PropertyText text, const std::function<void(const PropertyRemark&)>& remark) {
    Lines lines(text.content);
    for (const Finding& finding : Linter(text.content).findings()) {
        lines.advanceTo(finding.position);
        remark({finding.flaw, lines.line(), lines.column(), finding.firstLine});
    }
}

}  // namespace velkor::configuration
