// Sources and values by themselves.

#include <cstddef>
#include <set>
#include <sstream>
#include <string>

#include "configuration/admin/TypedText.hpp"
#include "configuration/admin/ValueFormat.hpp"
#include "configuration/sources/InMemorySource.hpp"
#include "configuration/sources/PropertyFileLint.hpp"
#include "configuration/sources/PropertyFileSource.hpp"
#include "framework/common/TextConversion.hpp"
#include "tests/failing/Foreign.hpp"
#include "tests/support/TemporaryFile.hpp"
#include "tests/support/ValueText.hpp"

namespace velkor::testing {
namespace {

using configuration::ConfigurationValue;
using configuration::InMemorySource;
using configuration::PropertyFileSource;
using configuration::PropertyText;
using configuration::ValueMap;

const std::string key = longText("key");
const ConfigurationValue held(longText("old"));

// Telling of a change is foreign code: the change has been made when it throws.
struct TableScene {
    TableScene() {
        source.setChangeListener([this](const std::string& changed) {
            told = changed;
            foreignCall();
        });
        told.reserve(2 * key.size());
    }

    InMemorySource source{ValueMap{{key, held}}};
    std::string told;
};

void setInATable(Trial& trial) {
    TableScene scene;
    const ConfigurationValue value(longText("new"));
    trial.passes([&] { scene.source.set(key, value); });
    EXPECT_TRUE(scene.source.get(key) == (scene.told.empty() ? held : value));
    scene.source.set(key, held);
}

void insertIntoATable(Trial& trial) {
    TableScene scene;
    const std::string added = longText("added");
    trial.passes([&] { scene.source.set(added, held); });
    EXPECT_EQ(scene.source.has(added), scene.told == added);
    scene.source.set(added, held);
    EXPECT_EQ(scene.source.keys().size(), 2U);
}

void takeFromATable(Trial& trial) {
    TableScene scene;
    trial.passes([&] { EXPECT_TRUE(scene.source.unset(key)); });
    EXPECT_EQ(scene.source.has(key), scene.told.empty());
}

void readATable(Trial& trial) {
    TableScene scene;
    if (trial.passes([&] {
            EXPECT_TRUE(scene.source.has(key) && scene.source.keys().count(key) == 1);
            EXPECT_TRUE(scene.source.get(key) == held);
        })) {
        EXPECT_TRUE(scene.source.has(key));
    }
}

std::string manyProperties() {
    std::string text;
    for (int i = 0; i < 300; ++i) text += longText(std::to_string(i)) + " = a\\u0041\\\n  value\n";
    return text;
}

void parseProperties(Trial& trial) {
    static const std::string text = manyProperties();
    std::size_t count = 0;
    if (trial.passes([&] { count = PropertyFileSource(PropertyText{text}).keys().size(); })) {
        EXPECT_EQ(count, 300U);
    }
}

// A file of which only the beginning was read for want of memory must not pass for the whole.
void readAPropertyFile(Trial& trial) {
    static const TemporaryFile file(manyProperties());
    const std::u16string path = common::TextConversion("UTF-8").toUtf16(file.path().string());
    std::size_t count = 0;
    if (trial.passes([&] { count = PropertyFileSource(path).keys().size(); })) {
        EXPECT_EQ(count, 300U);
    }
}

void readProperties(Trial& trial) {
    PropertyFileSource source(PropertyText{manyProperties()});
    const std::string first = longText("0");
    if (trial.passes([&] {
            EXPECT_TRUE(source.has(first));
            EXPECT_TRUE(source.get(first) == ConfigurationValue(std::string("aAvalue")));
        })) {
        EXPECT_EQ(source.keys().size(), 300U);
    }
}

void lintProperties(Trial& trial) {
    static const std::string text = longText("same") + " = 1\n[section]\n" + longText("same") +
                                    " = trailing   \n" + longText("escape") + " = \\u00\n";
    int remarks = 0;
    const auto count = [&](const configuration::PropertyRemark&) {
        ++remarks;
        foreignCall();
    };
    if (trial.passes([&] { configuration::lintProperties(PropertyText{text}, count); })) {
        EXPECT_GE(remarks, 3);
    }
}

void understandTypedText(Trial& trial) {
    const std::string text = longText("text");
    ConfigurationValue value;
    if (trial.passes([&] { value = configuration::typedText(text); })) {
        EXPECT_TRUE(value == ConfigurationValue(text));
    }
}

void understandATypedNumber(Trial& trial) {
    const std::string text = "1." + std::string(100, '0');
    ConfigurationValue value;
    if (trial.passes([&] { value = configuration::typedText(text); })) {
        EXPECT_EQ(textOf(value), textOf(ConfigurationValue(1.0)));
    }
}

// The stream is the caller's: its own exceptions say whether a text is whole.
void formatAList(Trial& trial) {
    const ConfigurationValue value(
        std::vector<std::u16string>{std::u16string(100, u'a'), std::u16string(100, u'b')});
    std::string text;
    if (trial.passes([&] {
            std::ostringstream out;
            out.exceptions(std::ios_base::badbit);
            configuration::formatValue(out, value);
            text = out.str();
        })) {
        EXPECT_EQ(text, "['" + std::string(100, 'a') + "', '" + std::string(100, 'b') + "']");
    }
}

constexpr Row sources[] = {
    {"SetInATable", setInATable},         {"InsertIntoATable", insertIntoATable},
    {"TakeFromATable", takeFromATable},   {"ReadATable", readATable},
    {"ParseProperties", parseProperties}, {"ReadAPropertyFile", readAPropertyFile},
    {"ReadProperties", readProperties},   {"LintProperties", lintProperties},
    {"TypedText", understandTypedText},   {"TypedNumber", understandATypedNumber},
    {"FormatAList", formatAList},
};
VELKOR_FAILING_ROWS(FailingSources, sources);

}  // namespace
}  // namespace velkor::testing
