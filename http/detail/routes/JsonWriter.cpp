#include "http/detail/routes/JsonWriter.hpp"

#include <Poco/NumberFormatter.h>

#include <algorithm>
#include <array>
#include <charconv>
#include <cmath>
#include <vector>

#include "framework/common/TextConversion.hpp"
#include "settings/Secrets.hpp"

namespace velkor::http::detail {

namespace {

common::TextConversion utf8() {
    return common::TextConversion("UTF-8");
}

constexpr bool isPlain(char character) {
    return character >= ' ' && character != '"' && character != '\\';
}

constexpr bool isAscii(char character) {
    return character >= 0;
}

}  // namespace

JsonWriter& JsonWriter::name(std::string_view plain) {
    separate();
    out += '"';
    out += plain;
    out += "\":";
    return *this;
}

JsonWriter& JsonWriter::text(std::string_view content) {
    separate();
    out += '"';
    if (std::all_of(content.begin(), content.end(), isPlain)) {
        out += content;
    } else if (std::all_of(content.begin(), content.end(), isAscii)) {
        appendEscaped(content);
    } else {
        appendEscaped(utf8().fromUtf16(utf8().toUtf16(std::string(content))));
    }
    out += '"';
    return *this;
}

void JsonWriter::appendEscaped(std::string_view content) {
    constexpr std::string_view shortForms = "\bb\tt\nn\ff\rr\"\"\\\\";
    constexpr const char* digits = "0123456789ABCDEF";
    for (const char character : content) {
        if (character < 0 || isPlain(character)) {
            out += character;
            continue;
        }
        std::size_t form = 0;
        while (form < shortForms.size() && shortForms[form] != character) form += 2;
        if (form < shortForms.size()) {
            out += {'\\', shortForms[form + 1]};
        } else {
            const auto code = static_cast<unsigned char>(character);
            out += {'\\', 'u', '0', '0', digits[code >> 4U], digits[code & 0xFU]};
        }
    }
}

JsonWriter& JsonWriter::number(std::int64_t content) {
    separate();
    std::array<char, 24> digits{};
    const auto end = std::to_chars(digits.begin(), digits.end(), content).ptr;
    out.append(digits.data(), static_cast<std::size_t>(end - digits.data()));
    return *this;
}

JsonWriter& JsonWriter::boolean(bool content) {
    separate();
    out += content ? "true" : "false";
    return *this;
}

JsonWriter& JsonWriter::value(const configuration::ConfigurationValue& content) {
    beginObject().member("type",
                         configuration::typeTags[static_cast<std::size_t>(content.which())]);
    name("value");
    boost::apply_visitor([this](const auto& held) { write(held); }, content);
    return endObject();
}

JsonWriter& JsonWriter::value(const configuration::ConfigurationValue& content, bool isSecret) {
    if (!isSecret) return value(content);
    return beginObject()
        .member("type", configuration::typeTags[static_cast<std::size_t>(content.which())])
        .member("value", settings::secretMark)
        .endObject();
}

void JsonWriter::write(double content) {
    separate();
    if (!std::isfinite(content)) {
        out += "null";
    } else if (content == 0 && std::signbit(content)) {
        out += "-0.0";
    } else {
        Poco::NumberFormatter::append(out, content);
    }
}

void JsonWriter::write(const std::u16string& content) {
    text(utf8().fromUtf16(content));
}

template <class T>
void JsonWriter::write(const std::vector<T>& content) {
    beginArray();
    for (const T& element : content) write(element);
    endArray();
}

}  // namespace velkor::http::detail
