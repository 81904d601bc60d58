#include <gtest/gtest.h>

#include <cstdio>
#include <optional>
#include <string>
#include <vector>

#include "settings/Constraint.hpp"
#include "settings/Conversion.hpp"

namespace velkor::settings::testing {
namespace {

struct Version {
    int major = 0;
    int minor = 0;

    friend bool operator<(const Version& left, const Version& right) {
        return left.major != right.major ? left.major < right.major : left.minor < right.minor;
    }
};

}  // namespace
}  // namespace velkor::settings::testing

template <>
struct velkor::settings::Conversion<velkor::settings::testing::Version> {
    using Version = testing::Version;

    static std::string typeName() { return "version"; }

    static Converted<Version> from(const configuration::ConfigurationValue& value) {
        return Conversion<std::string>::from(value).then(
            [](const std::string& text) -> Converted<Version> {
                Version version;
                const int read = std::sscanf(text.c_str(), "%d.%d", &version.major, &version.minor);
                if (read != 2) return Reason{"not two numbers with a point between them"};
                return version;
            });
    }

    static std::string show(const Version& version) {
        return std::to_string(version.major) + "." + std::to_string(version.minor);
    }
};

namespace velkor::settings::testing {
namespace {

using configuration::ConfigurationValue;

TEST(OwnType, IsReadByItsOwnConversion) {
    const auto read = Conversion<Version>::from(std::string("2.11"));
    ASSERT_TRUE(read);
    EXPECT_EQ(read.value().minor, 11);
}

TEST(OwnType, GivesItsOwnReason) {
    const auto read = Conversion<Version>::from(std::string("two"));
    ASSERT_FALSE(read);
    EXPECT_EQ(read.reason().text, "not two numbers with a point between them");
}

TEST(OwnType, HandsOnTheReasonOfWhatItBuildsOn) {
    const auto read = Conversion<Version>::from(std::vector<int>{2, 11});
    ASSERT_FALSE(read);
    EXPECT_EQ(read.reason().text, "a list, where one value is wanted");
}

TEST(OwnType, IsReadInLists) {
    const auto read = Conversion<std::vector<Version>>::from(std::string("1.2, 3.4"));
    ASSERT_TRUE(read);
    EXPECT_EQ(Conversion<std::vector<Version>>::show(read.value()), "1.2, 3.4");
}

TEST(OwnType, MayBeMissing) {
    const auto read = Conversion<std::optional<Version>>::from(std::string());
    ASSERT_TRUE(read);
    EXPECT_FALSE(read.value().has_value());
}

TEST(OwnType, HasBounds) {
    const Constraint<Version> constraint = atLeast(Version{1, 2});
    EXPECT_EQ(constraint.description(), "at least 1.2");
    EXPECT_TRUE(constraint.check(Version{1, 1}));
    EXPECT_FALSE(constraint.check(Version{1, 2}));
}

}  // namespace
}  // namespace velkor::settings::testing
