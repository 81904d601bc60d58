#include "http/detail/routes/ChangeRequest.hpp"

#include <Poco/Dynamic/Var.h>
#include <Poco/JSON/Array.h>
#include <Poco/JSON/Object.h>

#include <algorithm>
#include <initializer_list>
#include <limits>
#include <optional>
#include <string_view>
#include <type_traits>
#include <utility>

#include "framework/common/TextConversion.hpp"
#include "http/detail/routes/Problem.hpp"
#include "http/detail/routes/Target.hpp"

namespace velkor::http::detail {

namespace {

using configuration::Change;
using configuration::ConfigurationValue;
using Poco::Dynamic::Var;
using Poco::JSON::Array;
using Poco::JSON::Object;

[[noreturn]] void refuse(const std::string& where, const std::string& what) {
    throw Problem(ProblemKind::badRequest, where + ": " + what);
}

void requireMembers(const Object& object, std::initializer_list<std::string_view> known,
                    const std::string& where) {
    for (const auto& member : object) {
        if (std::find(known.begin(), known.end(), member.first) == known.end()) {
            refuse(where, "unknown member \"" + member.first + "\"");
        }
    }
}

// Null where there is none, or something else.
template <class T>
const T* heldBy(const Var* json) {
    return json != nullptr && json->type() == typeid(T) ? &json->extract<T>() : nullptr;
}

const std::string* textIn(const Var* json) {
    return heldBy<std::string>(json);
}

const Object* objectIn(const Var& json) {
    const auto* const object = heldBy<Object::Ptr>(&json);
    return object == nullptr ? nullptr : object->get();
}

const Array* arrayIn(const Var& json) {
    const auto* const array = heldBy<Array::Ptr>(&json);
    return array == nullptr ? nullptr : array->get();
}

const Var* findMember(const Object& object, const std::string& name) {
    const auto member = std::find_if(object.begin(), object.end(),
                                     [&](const auto& each) { return each.first == name; });
    return member == object.end() ? nullptr : &member->second;
}

bool isWhole(const Var& json) {
    return json.isInteger() && json.type() != typeid(bool);
}

// Each gives false where `json` is not of the form of the type.

bool read(const Var& json, bool& content) {
    if (json.type() != typeid(bool)) return false;
    content = json.extract<bool>();
    return true;
}

template <class Integer>
bool readInteger(const Var& json, Integer& content) {
    if (json.type() != typeid(Poco::Int64)) return false;
    const Poco::Int64 number = json.extract<Poco::Int64>();
    using Limits = std::numeric_limits<Integer>;
    if (number < Limits::min() || number > Limits::max()) return false;
    content = static_cast<Integer>(number);
    return true;
}

bool read(const Var& json, int& content) {
    return readInteger(json, content);
}

bool read(const Var& json, unsigned& content) {
    return readInteger(json, content);
}

bool read(const Var& json, double& content) {
    if (json.type() != typeid(double) && !isWhole(json)) return false;
    json.convert(content);
    return true;
}

bool read(const Var& json, std::string& content) {
    const std::string* const text = textIn(&json);
    if (text != nullptr) content = *text;
    return text != nullptr;
}

bool read(const Var& json, std::u16string& content) {
    const std::string* const text = textIn(&json);
    if (text == nullptr || !isUtf8(*text)) return false;
    content = common::TextConversion("UTF-8").toUtf16(*text);
    return true;
}

template <class T>
bool read(const Var& json, std::vector<T>& content) {
    const Array* const array = arrayIn(json);
    if (array == nullptr) return false;
    content.reserve(array->size());
    return std::all_of(array->begin(), array->end(), [&](const Var& element) {
        T each{};
        const bool fits = read(element, each);
        content.push_back(std::move(each));
        return fits;
    });
}

ConfigurationValue parsedValue(const Var& json, const std::string& where) {
    const Object* const object = objectIn(json);
    if (object == nullptr) refuse(where, "is no object of \"type\" and \"value\"");
    requireMembers(*object, {"type", "value"}, where);
    const std::string* const tag = textIn(findMember(*object, "type"));
    const Var* const content = findMember(*object, "value");
    if (tag == nullptr) refuse(where, "\"type\" is missing or no text");
    if (content == nullptr) refuse(where, "\"value\" is missing");
    std::optional<ConfigurationValue> value;
    bool isKnown = false;
    configuration::forEachValueKind([&](const auto& kind) {
        if (kind.tag != *tag) return;
        isKnown = true;
        typename std::decay_t<decltype(kind)>::Type held{};
        if (read(*content, held)) value = std::move(held);
    });
    if (!isKnown) refuse(where, "unknown type \"" + *tag + "\"");
    if (!value) refuse(where, "\"value\" is not of the type \"" + *tag + "\"");
    return *std::move(value);
}

Change parsedChange(const Var& json, const std::string& where) {
    const Object* const object = objectIn(json);
    if (object == nullptr) refuse(where, "is no object");
    requireMembers(*object, {"key", "value", "unset", "source"}, where);
    const std::string* const key = textIn(findMember(*object, "key"));
    if (key == nullptr) refuse(where + ".key", "is missing or no text");
    Change change{*key};
    if (const Var* const source = findMember(*object, "source")) {
        const std::string* const name = textIn(source);
        if (name == nullptr) refuse(where + ".source", "is no text");
        change.source = *name;
    }
    const Var* const value = findMember(*object, "value");
    const Var* const unset = findMember(*object, "unset");
    if ((value == nullptr) == (unset == nullptr)) {
        refuse(where, "needs one of \"value\" and \"unset\"");
    }
    if (value != nullptr) {
        change.value = parsedValue(*value, where + ".value");
    } else if (unset->type() != typeid(bool) || !unset->extract<bool>()) {
        refuse(where + ".unset", "is not true");
    }
    return change;
}

}  // namespace

std::vector<Change> parsedChanges(const std::string& text, const messages::JsonLimits& limits) {
    const Object::Ptr body = messages::parseJsonObject(text, limits);
    requireMembers(*body, {"changes"}, "The body");
    const Var* const member = findMember(*body, "changes");
    const Array* const array = member == nullptr ? nullptr : arrayIn(*member);
    if (array == nullptr || array->size() == 0)
        refuse("changes", "is missing or no list of changes");
    std::vector<Change> changes;
    changes.reserve(array->size());
    for (const Var& element : *array) {
        changes.push_back(parsedChange(element, "changes[" + std::to_string(changes.size()) + "]"));
    }
    return changes;
}

}  // namespace velkor::http::detail
