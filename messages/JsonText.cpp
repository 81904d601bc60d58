#include "messages/JsonText.hpp"

#include <Poco/Dynamic/Var.h>
#include <Poco/Exception.h>
#include <Poco/JSON/Array.h>
#include <Poco/JSON/Parser.h>
#include <Poco/JSON/Stringifier.h>

#include <algorithm>
#include <cmath>
#include <locale>
#include <ostream>
#include <sstream>
#include <typeinfo>

#include "framework/common/TextConversion.hpp"

namespace velkor::messages {

namespace {

using Poco::Dynamic::Var;
using Poco::JSON::Array;
using Poco::JSON::Object;

/// Counts how deep a text is nested, without knowing more of JSON than what a string is.
class NestingCounter {
public:
    /// The depth behind `character`, which follows those given before.
    std::size_t depthAfter(char character) {
        if (inString) {
            onStringCharacter(character);
        } else {
            onCharacter(character);
        }
        return depth;
    }

    /// How many objects and arrays have begun.
    std::size_t containers() const noexcept { return begun; }

private:
    void onStringCharacter(char character) {
        if (escaped) {
            escaped = false;
        } else if (character == '\\') {
            escaped = true;
        } else if (character == '"') {
            inString = false;
        }
    }

    void onCharacter(char character) {
        if (character == '"') {
            inString = true;
        } else if (character == '{' || character == '[') {
            ++depth;
            ++begun;
        } else if ((character == '}' || character == ']') && depth > 0) {
            --depth;
        }
    }

    std::size_t depth = 0;
    std::size_t begun = 0;
    bool inString = false;
    bool escaped = false;
};

// Looked at before the parser is, which recurses at each level.
void requireWithinLimits(const std::string& text, const JsonLimits& limits) {
    if (text.size() > limits.bytes) {
        throw NoJsonObject("JSON text exceeds " + std::to_string(limits.bytes) + " bytes");
    }
    NestingCounter nesting;
    if (std::any_of(text.begin(), text.end(),
                    [&](char character) { return nesting.depthAfter(character) > limits.depth; })) {
        throw NoJsonObject("JSON text is nested more than " + std::to_string(limits.depth) +
                           " levels deep");
    }
    if (nesting.containers() > limits.containers) {
        throw NoJsonObject("JSON text holds more than " + std::to_string(limits.containers) +
                           " objects and arrays");
    }
}

Var parse(const std::string& text) {
    try {
        Poco::JSON::Parser parser;
        return parser.parse(text);
    } catch (const Poco::Exception& error) {
        throw NoJsonObject("Invalid JSON text: " + error.displayText());
    }
}

std::string inUtf8(const std::string& text) {
    const common::TextConversion utf8("UTF-8");
    return utf8.fromUtf16(utf8.toUtf16(text));
}

void renderText(const std::string& text, std::ostream& out) {
    const bool ascii = std::all_of(text.begin(), text.end(), [](char c) { return c >= 0; });
    Poco::JSON::Stringifier::formatString(ascii ? text : inUtf8(text), out);
}

// POCO drops the sign of zero.
void renderNumber(double number, std::ostream& out) {
    if (!std::isfinite(number)) {
        out << "null";
    } else if (number == 0 && std::signbit(number)) {
        out << "-0.0";
    } else {
        Poco::JSON::Stringifier::stringify(number, out);
    }
}

void renderObject(const Object& object, std::ostream& out);
void renderArray(const Array& array, std::ostream& out);

void renderAny(const Var& value, std::ostream& out) {
    if (value.type() == typeid(Object::Ptr)) {
        renderObject(*value.extract<Object::Ptr>(), out);
    } else if (value.type() == typeid(Array::Ptr)) {
        renderArray(*value.extract<Array::Ptr>(), out);
    } else if (value.type() == typeid(double)) {
        renderNumber(value.extract<double>(), out);
    } else if (value.type() == typeid(std::string)) {
        renderText(value.extract<std::string>(), out);
    } else {
        Poco::JSON::Stringifier::stringify(value, out);
    }
}

void renderObject(const Object& object, std::ostream& out) {
    const char* separator = "";
    out << '{';
    for (const auto& [name, value] : object) {
        out << separator;
        renderText(name, out);
        out << ':';
        renderAny(value, out);
        separator = ",";
    }
    out << '}';
}

void renderArray(const Array& array, std::ostream& out) {
    const char* separator = "";
    out << '[';
    for (const Var& value : array) {
        out << separator;
        renderAny(value, out);
        separator = ",";
    }
    out << ']';
}

}  // namespace

Object::Ptr parseJsonObject(const std::string& text, const JsonLimits& limits) {
    requireWithinLimits(text, limits);
    const Var parsed = parse(text);
    if (parsed.type() != typeid(Object::Ptr)) throw NoJsonObject("JSON text is not an object");
    return parsed.extract<Object::Ptr>();
}

std::string renderJson(const Object& object) {
    std::ostringstream out;
    out.exceptions(std::ios::badbit);  // lack of memory must not end the text early
    out.imbue(std::locale::classic());
    renderObject(object, out);
    return out.str();
}

}  // namespace velkor::messages
