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
