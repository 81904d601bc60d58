#include "configuration/service/MessageTypes.hpp"

#include <gtest/gtest.h>

#include <string>
#include <vector>

namespace velkor::configuration {
namespace {

using Names = std::vector<std::string>;

TEST(MessageTypes, AreNamedAfterTheirClasses) {
    EXPECT_EQ(messageTypeOf<ConfigurationSet>.name(), "velkor/configuration/ConfigurationSet");
    EXPECT_EQ(messageTypeOf<ConfigurationGet>.name(), "velkor/configuration/ConfigurationGet");
    EXPECT_EQ(messageTypeOf<ConfigurationKeys>.name(), "velkor/configuration/ConfigurationKeys");
    EXPECT_EQ(messageTypeOf<ConfigurationKeysResponse>.name(),
              "velkor/configuration/ConfigurationKeysResponse");
    EXPECT_EQ(messageTypeOf<ConfigurationOptionResponse>.name(),
              "velkor/configuration/ConfigurationOptionResponse");
    EXPECT_EQ(messageTypeOf<AddPropertyFileSource>.name(),
              "velkor/configuration/AddPropertyFileSource");
}

TEST(MessageTypes, AreVisitedInTheirOrder) {
    Names names;
    forEachMessageType([&](const auto& type) { names.emplace_back(type.shortName); });
    EXPECT_EQ(names, (Names{"ConfigurationSet", "ConfigurationGet", "ConfigurationKeys",
                            "ConfigurationKeysResponse", "ConfigurationOptionResponse",
                            "AddPropertyFileSource"}));
}

TEST(MessageTypes, OfRequestsAreThoseThatTheServiceAnswers) {
    Names names;
    forEachRequestType([&](const auto& type) { names.emplace_back(type.shortName); });
    EXPECT_EQ(names, (Names{"ConfigurationSet", "ConfigurationGet", "ConfigurationKeys",
                            "AddPropertyFileSource"}));
}

}  // namespace
}  // namespace velkor::configuration
