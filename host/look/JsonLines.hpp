#pragma once

#include <Poco/JSON/Array.h>
#include <Poco/JSON/Object.h>

#include <string>
#include <vector>

#include "configuration/Option.hpp"
#include "host/console/Command.hpp"

namespace velkor::host {

/// `value` as an object of its type and itself, as messages hold it; the value of a secret is •••.
Poco::JSON::Object::Ptr valueJson(const configuration::ConfigurationValue& value, bool isSecret);

/// As above, with the name of its source: {"source":...,"value":{...}}.
Poco::JSON::Object::Ptr optionJson(const configuration::Option& option, bool isSecret);

/// An array of `holders`, each as above.
Poco::JSON::Array::Ptr holdersJson(const std::vector<configuration::Option>& holders,
                                   bool isSecret);

/// Writes one JSON object over several lines, a member on each, as it is made.
class JsonLines {
public:
    /// Begins the object in `commandOutput`, which must live as long.
    explicit JsonLines(CommandOutput& commandOutput) : output(commandOutput) { output.line("{"); }

    /// Adds the member `name`, which is another one than those before.
    void add(const std::string& name, const Poco::Dynamic::Var& value);

    /// Ends the object.
    void end();

private:
    CommandOutput& output;
    std::string last;  // which lacks a comma unless it is the last one
};

}  // namespace velkor::host
