#include <string_view>

#include "configuration/service/ValueJson.hpp"
#include "host/TerminalText.hpp"
#include "host/console/OptionWords.hpp"
#include "host/lint/Remarks.hpp"
#include "host/look/FileFormat.hpp"
#include "host/look/LookCommands.hpp"
#include "host/sources/PropertyFile.hpp"
#include "messages/JsonText.hpp"

namespace velkor::host {

namespace {

using configuration::Change;
using configuration::ConfigurationValue;
using Poco::JSON::Object;

constexpr std::string_view escapedZero = "\\u0000";

/// The text between the quotes of the string that begins behind position `begin` of valid JSON.
std::string_view stringAt(std::string_view json, std::size_t begin) {
    std::size_t end = begin;
    while (end < json.size() && json[end] != '"') end += json[end] == '\\' ? 2U : 1U;
    return json.substr(begin, end - begin);
}

bool holdsZero(std::string_view string) {
    for (auto at = string.find('\\'); at != std::string_view::npos;
         at = string.find('\\', at + 2)) {
        if (string.substr(at, escapedZero.size()) == escapedZero) return true;
    }
    return false;
}

// The parser ends a name at this character, which would make it the name of something else.
void refuseNamesWithZero(std::string_view json) {
    if (json.find(escapedZero) == std::string_view::npos) return;
    for (auto quote = json.find('"'); quote != std::string_view::npos;) {
        const std::string_view string = stringAt(json, quote + 1);
        const std::size_t end = quote + string.size() + 2;
        const std::size_t next = json.find_first_not_of(" \t\r\n", end);
        const bool isName = next != std::string_view::npos && json[next] == ':';
        if (isName && holdsZero(string)) {
            throw CommandError("the name \"" + std::string(string) +
                               "\" holds the character U+0000, without which it would be another");
        }
        quote = json.find('"', end);
    }
}

FileFormat formatOf(const std::string& text) {
    const auto first = text.find_first_not_of(" \t\r\n");
    return first != std::string::npos && text[first] == '{' ? FileFormat::json
                                                            : FileFormat::properties;
}

std::vector<Change> changesInProperties(const std::string& text) {
    configuration::PropertyFileSource source(configuration::PropertyText{text});
    std::vector<Change> changes;
    for (const auto& key : source.keys()) changes.push_back({key, source.get(key)});
    return changes;
}

// Reading is lenient; what it would not write again is not what it looks like.
ConfigurationValue valueIn(const std::string& key, const Poco::Dynamic::Var& member) {
    ConfigurationValue value;
    configuration::readJson(member, value);
    const auto written = configuration::toJson(value).extract<Object::Ptr>();
    const bool isObject = member.type() == typeid(Object::Ptr);
    if (isObject &&
        messages::renderJson(*member.extract<Object::Ptr>()) == messages::renderJson(*written)) {
        return value;
    }
    throw CommandError(key + " is no object of a type and a value of that type");
}

std::vector<Change> changesInJson(const std::string& text, const SourceLimits& limits) {
    messages::JsonLimits jsonLimits;
    jsonLimits.bytes = limits.fileBytes;
    const auto object = messages::parseJsonObject(text, jsonLimits);
    refuseNamesWithZero(text);
    std::vector<Change> changes;
    changes.reserve(object->size());
    for (const auto& [key, member] : *object) changes.push_back({key, valueIn(key, member)});
    return changes;
}

std::vector<Change> changesIn(const std::string& text, FileFormat format,
                              const SourceLimits& limits) {
    return format == FileFormat::json ? changesInJson(text, limits) : changesInProperties(text);
}

}  // namespace

void importFile(const std::shared_ptr<SessionStore>& store,
                const std::vector<std::string>& arguments, CommandOutput& output) {
    const OptionWords given("import", importUsage, 1, arguments);
    const std::string& path = given.words().front().text;
    const std::string text = readPropertyFile(path, store->sourceLimits());
    const FileFormat format = chosenFormat(given).value_or(formatOf(text));
    std::vector<Change> changes;
    try {
        changes = changesIn(text, format, store->sourceLimits());
    } catch (const std::invalid_argument& error) {
        throw CommandError(path + ": " + error.what());
    } catch (const CommandError& error) {
        throw CommandError(path + ": " + error.what());
    }
    const std::size_t remarks = format == FileFormat::properties ? countRemarks(text) : 0;
    if (remarks != 0) output.note(remarksNotice(path, remarks));
    store->noteWrite();
    store->apply(changes).get();
}

}  // namespace velkor::host
