#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <utility>

#include "configuration/ConfigurationValue.hpp"

namespace velkor::http::detail {

/// Writes one JSON text, on a single line and without spaces: what is written is what
/// `messages::renderJson` would make of it, byte for byte. A number that is not finite is null, and
/// bytes that are no UTF-8 become U+FFFD. Who calls it sees to it that objects and arrays are
/// closed, and that members have names.
class JsonWriter {
public:
    /// With room for a short text.
    JsonWriter() { out.reserve(256); }

    JsonWriter& beginObject() { return open('{'); }
    JsonWriter& endObject() { return close('}'); }
    JsonWriter& beginArray() { return open('['); }
    JsonWriter& endArray() { return close(']'); }

    /// The name of a member, whose value comes next. Written as it is: it needs no escaping.
    JsonWriter& name(std::string_view plain);

    /// As above, for a name of any characters.
    JsonWriter& anyName(std::string_view content) {
        text(content);
        out += ':';
        return *this;
    }

    JsonWriter& text(std::string_view content);
    JsonWriter& number(std::int64_t content);
    JsonWriter& boolean(bool content);

    /// A value as in messages: an object of "type" and "value".
    JsonWriter& value(const configuration::ConfigurationValue& content);

    /// As above, with ••• in the place of what is secret.
    JsonWriter& value(const configuration::ConfigurationValue& content, bool isSecret);

    /// Members of the object that is open.
    JsonWriter& member(std::string_view plain, std::string_view content) {
        return name(plain).text(content);
    }
    JsonWriter& member(std::string_view plain, bool content) {
        return name(plain).boolean(content);
    }
    JsonWriter& member(std::string_view plain, const char* content) {
        return name(plain).text(content);
    }

    /// What has been written; the writer is done.
    std::string take() { return std::move(out); }

private:
    JsonWriter& open(char bracket) {
        separate();
        out += bracket;
        return *this;
    }
    JsonWriter& close(char bracket) {
        out += bracket;
        return *this;
    }

    // No value ends in a character that opens something.
    void separate() {
        if (out.empty()) return;
        const char last = out.back();
        if (last != '{' && last != '[' && last != ':') out += ',';
    }

    void write(bool content) { boolean(content); }
    void write(int content) { number(content); }
    void write(unsigned content) { number(content); }
    void write(double content);
    void write(const std::string& content) { text(content); }
    void write(const std::u16string& content);
    template <class T>
    void write(const std::vector<T>& content);

    void appendEscaped(std::string_view utf8);

    std::string out;
};

}  // namespace velkor::http::detail
