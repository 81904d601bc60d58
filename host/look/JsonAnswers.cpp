#include "host/look/JsonAnswers.hpp"

#include <Poco/JSON/Array.h>

#include "host/console/TimeText.hpp"
#include "host/look/JsonLines.hpp"
#include "host/sources/SourceStates.hpp"
#include "messages/JsonText.hpp"

namespace velkor::host {

using Poco::JSON::Array;
using Poco::JSON::Object;

namespace {

void addState(Object& row, const configuration::SourceState& state) {
    const std::string problem = problemText(state);
    if (!problem.empty()) row.set("problem", problem);
    Object::Ptr shown = new Object;
    shown->set("well", state.isWell);
    if (state.since) shown->set("since", timeText(*state.since));
    if (state.updated) shown->set("updated", timeText(*state.updated));
    if (!state.lastError.empty()) shown->set("lastError", state.lastError);
    Object::Ptr details = new Object;
    for (const auto& [name, text] : state.details) details->set(name, text);
    shown->set("details", details);
    row.set("state", shown);
}

}  // namespace

std::string sourcesJson(const std::vector<configuration::SourceDescription>& sources) {
    Array::Ptr rows = new Array;
    for (const auto& source : sources) {
        Object::Ptr row = new Object;
        row->set("name", source.name);
        row->set("group", source.group);
        row->set("order", source.order);
        row->set("readOnly", source.readOnly);
        if (source.state) addState(*row, *source.state);
        rows->add(row);
    }
    Object answer;
    answer.set("sources", rows);
    return messages::renderJson(answer);
}

std::string layersJson(const std::string& key, const std::vector<configuration::Option>& holders,
                       bool isSecret) {
    Object answer;
    answer.set("key", key);
    answer.set("layers", holdersJson(holders, isSecret));
    return messages::renderJson(answer);
}

std::string watchedJson(const std::string& key, const configuration::ConfigurationValue& value,
                        bool isSecret) {
    Object answer;
    answer.set("key", key);
    answer.set("value", valueJson(value, isSecret));
    return messages::renderJson(answer);
}

}  // namespace velkor::host
