#include "host/look/JsonLines.hpp"

#include "configuration/service/ValueJson.hpp"
#include "messages/JsonText.hpp"
#include "settings/Secrets.hpp"

namespace velkor::host {

Poco::JSON::Object::Ptr valueJson(const configuration::ConfigurationValue& value, bool isSecret) {
    auto json = configuration::toJson(value).extract<Poco::JSON::Object::Ptr>();
    if (isSecret) json->set("value", std::string(settings::secretMark));
    return json;
}

Poco::JSON::Object::Ptr optionJson(const configuration::Option& option, bool isSecret) {
    Poco::JSON::Object::Ptr json = new Poco::JSON::Object;
    json->set("source", option.source);
    json->set("value", valueJson(option.value, isSecret));
    return json;
}

Poco::JSON::Array::Ptr holdersJson(const std::vector<configuration::Option>& holders,
                                   bool isSecret) {
    Poco::JSON::Array::Ptr array = new Poco::JSON::Array;
    for (const auto& holder : holders) array->add(optionJson(holder, isSecret));
    return array;
}

void JsonLines::add(const std::string& name, const Poco::Dynamic::Var& value) {
    if (!last.empty()) output.line(last + ',');
    Poco::JSON::Object member;
    member.set(name, value);
    const std::string object = messages::renderJson(member);
    last = object.substr(1, object.size() - 2);  // without its braces
}

void JsonLines::end() {
    if (!last.empty()) output.line(last);
    output.line("}");
}

}  // namespace velkor::host
