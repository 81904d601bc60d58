// Any bytes as a property file, read by the parser and by a reader that takes the description of
// the format to the letter, one byte after the other.

#include <sstream>
#include <string>
#include <string_view>

#include "configuration/sources/PropertyFileSource.hpp"
#include "fuzz/Finding.hpp"
#include "fuzz/Targets.hpp"
#include "tests/support/ReferencePropertyReader.hpp"

namespace velkor::fuzz {
namespace {

using configuration::PropertyFileSource;
using configuration::PropertyText;
using testing::Properties;

std::string textOf(const Properties& properties) {
    std::string text;
    for (const auto& [key, value] : properties) text += spelled(key) + "=" + spelled(value) + " ";
    return text;
}

Properties propertiesOf(PropertyFileSource& source) {
    Properties properties;
    for (const std::string& key : source.keys()) {
        expectThat(source.has(key), "A key that is listed is there", spelled(key));
        properties[key] = boost::get<std::string>(source.get(key));
    }
    return properties;
}

void comparePropertiesOf(std::string_view input) {
    std::istringstream stream{std::string(input)};
    const Properties expected = testing::ReferencePropertyReader(stream).read();
    PropertyFileSource source(PropertyText{input});
    const Properties actual = propertiesOf(source);
    if (actual != expected) report("Properties", textOf(expected), textOf(actual));
    const std::string unlisted(input);
    if (source.has(unlisted) != (expected.count(unlisted) != 0)) {
        report("Whether a key is there", expected.count(unlisted) != 0 ? "it is" : "it is not",
               spelled(unlisted));
    }
}

const Target target("properties", comparePropertiesOf);

}  // namespace
}  // namespace velkor::fuzz
