#include "host/look/JsonAnswers.hpp"

#include <Poco/JSON/Array.h>

#include "host/look/JsonLines.hpp"
#include "messages/JsonText.hpp"

namespace velkor::host {

using Poco::JSON::Array;
using Poco::JSON::Object;

std::string sourcesJson(const std::vector<configuration::SourceDescription>& sources,
                        const std::function<std::string(const std::string& name)>& problemOf) {
    Array::Ptr rows = new Array;
    for (const auto& source : sources) {
        Object::Ptr row = new Object;
        row->set("name", source.name);
        row->set("group", source.group);
        row->set("order", source.order);
        row->set("readOnly", source.readOnly);
        const std::string problem = problemOf(source.name);
        if (!problem.empty()) row->set("problem", problem);
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
