#include "fuzz/http/LiteralChanges.hpp"

#include <Poco/Dynamic/Var.h>
#include <Poco/JSON/Array.h>
#include <Poco/JSON/Object.h>

#include <cstdint>
#include <set>

#include "framework/common/TextConversion.hpp"
#include "fuzz/http/LiteralJson.hpp"
#include "messages/JsonText.hpp"

namespace velkor::fuzz::http {

namespace {

using configuration::Change;
using configuration::ConfigurationValue;
using Poco::Dynamic::Var;
using Poco::JSON::Array;
using Poco::JSON::Object;

/// The body is not of the form.
struct Unfit {};

void require(bool holds) {
    if (!holds) throw Unfit();
}

template <class T>
T as(const Var& json) {
    require(json.type() == typeid(T));
    return json.extract<T>();
}

// A whole number from `least` to `most`, without a fraction or an exponent.
std::int64_t whole(const Var& json, std::int64_t least, std::int64_t most) {
    const auto number = as<Poco::Int64>(json);
    require(least <= number && number <= most);
    return number;
}

bool truth(const Var& json) {
    return as<bool>(json);
}

int integer(const Var& json) {
    return static_cast<int>(whole(json, -2147483648LL, 2147483647));
}

unsigned natural(const Var& json) {
    return static_cast<unsigned>(whole(json, 0, 4294967295LL));
}

double number(const Var& json) {
    if (json.type() == typeid(Poco::UInt64)) return static_cast<double>(as<Poco::UInt64>(json));
    if (json.type() == typeid(Poco::Int64)) return static_cast<double>(as<Poco::Int64>(json));
    return as<double>(json);
}

std::string text(const Var& json) {
    return as<std::string>(json);
}

std::u16string wide(const Var& json) {
    require(isCleanText(text(json)));
    return common::TextConversion("UTF-8").toUtf16(text(json));
}

template <class T>
std::vector<T> list(const Var& json, T (*element)(const Var&)) {
    const auto array = as<Array::Ptr>(json);
    std::vector<T> all;
    for (const Var& each : *array) all.push_back(element(each));
    return all;
}

ConfigurationValue content(const std::string& tag, const Var& json) {
    if (tag == "bool") return truth(json);
    if (tag == "int") return integer(json);
    if (tag == "uint") return natural(json);
    if (tag == "double") return number(json);
    if (tag == "ustring") return wide(json);
    if (tag == "string") return text(json);
    if (tag == "boolArray") return list(json, truth);
    if (tag == "intArray") return list(json, integer);
    if (tag == "uintArray") return list(json, natural);
    if (tag == "doubleArray") return list(json, number);
    if (tag == "stringArray") return list(json, text);
    if (tag == "ustringArray") return list(json, wide);
    throw Unfit();
}

/// An object all of whose members have to be asked for.
class Members {
public:
    explicit Members(const Var& json) : object(as<Object::Ptr>(json)) {
        require(!object.isNull());
        for (const auto& member : *object) unasked.insert(member.first);
    }

    bool has(const std::string& name) { return object->has(name); }

    Var operator[](const std::string& name) {
        require(has(name));
        unasked.erase(name);
        return object->get(name);
    }

    void requireAllAsked() const { require(unasked.empty()); }

private:
    const Object::Ptr object;
    std::set<std::string> unasked;
};

ConfigurationValue readValue(const Var& json) {
    Members members(json);
    auto value = content(text(members["type"]), members["value"]);
    members.requireAllAsked();
    return value;
}

Change readChange(const Var& json) {
    Members members(json);
    Change change{text(members["key"])};
    if (members.has("source")) change.source = text(members["source"]);
    if (members.has("value")) {
        change.value = readValue(members["value"]);
    } else {
        require(truth(members["unset"]));
    }
    members.requireAllAsked();
    return change;
}

}  // namespace

std::optional<std::vector<Change>> readChanges(const std::string& body) {
    try {
        Members members(messages::parseJsonObject(body));
        const auto changes = list(members["changes"], readChange);
        members.requireAllAsked();
        require(!changes.empty());
        return changes;
    } catch (const Unfit&) {
        return std::nullopt;
    } catch (const messages::NoJsonObject&) {
        return std::nullopt;
    }
}

}  // namespace velkor::fuzz::http
