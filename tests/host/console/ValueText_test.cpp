#include "host/console/ValueText.hpp"

#include <gtest/gtest.h>

#include <locale>
#include <memory>
#include <ostream>
#include <string>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "configuration/admin/ConfigurationCommandProvider.hpp"
#include "host/console/CommandRegistry.hpp"
#include "tests/support/ScopedGlobalLocale.hpp"

namespace velkor::host {
namespace {

using configuration::ConfigurationValue;

struct ValueCase {
    const char* name;
    ConfigurationValue value;

    friend std::ostream& operator<<(std::ostream& out, const ValueCase& it) {
        return out << it.name;
    }
};

class ValueTextTest : public ::testing::TestWithParam<ValueCase> {};

TEST_P(ValueTextTest, IsWhatTheGetCommandShows) {
    const auto store = std::make_shared<configuration::ConfigurationImpl>();
    const auto registry = std::make_shared<CommandRegistry>();
    const configuration::ConfigurationCommandProvider commands(store, registry);
    const ConfigurationValue& value = GetParam().value;
    store->set("key", value);
    EXPECT_EQ(valueText(value), registry->find("get")->run({"key"}));
    EXPECT_EQ(optionText("key", value) + '\n', registry->find("list")->run({}));
}

INSTANTIATE_TEST_SUITE_P(Values, ValueTextTest,
                         ::testing::Values(ValueCase{"Bool", true}, ValueCase{"Int", -7},
                                           ValueCase{"Uint", 7U}, ValueCase{"Double", 1234567.0},
                                           ValueCase{"Text", std::string("it's")},
                                           ValueCase{"Utf16Text", std::u16string(u"\u20ac")},
                                           ValueCase{"DoubleArray", std::vector<double>{0.1, 2}},
                                           ValueCase{"EmptyArray", std::vector<std::string>{}}),
                         [](const auto& tested) { return std::string(tested.param.name); });

TEST(ValueText, SaysNothingOfASecret) {
    const ConfigurationValue value(std::string("verysecret"));
    EXPECT_EQ(valueText(value, true), "•••");
    EXPECT_EQ(optionText("key", value, true), "key = •••");
}

TEST(ValueText, WritesNumbersInTheCLocale) {
    const velkor::testing::ScopedGlobalLocale comma(
        std::locale(std::locale::classic(), new velkor::testing::CommaNumbers));
    EXPECT_EQ(valueText(ConfigurationValue(1234.5)), "1234.5");
    EXPECT_EQ(valueText(ConfigurationValue(1234567)), "1234567");
}

}  // namespace
}  // namespace velkor::host
