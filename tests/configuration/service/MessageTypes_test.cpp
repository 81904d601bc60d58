#include "configuration/service/MessageTypes.hpp"

#include <gtest/gtest.h>

#include <boost/core/demangle.hpp>
#include <string>
#include <type_traits>
#include <typeinfo>
#include <vector>

namespace velkor::configuration {
namespace {

using Names = std::vector<std::string>;

TEST(MessageTypes, AreNamedAfterTheirClasses) {
    forEachMessageType([](const auto& type) {
        using Class = typename std::decay_t<decltype(type)>::Class;
        EXPECT_EQ("velkor::configuration::" + std::string(type.shortName),
                  boost::core::demangle(typeid(Class).name()));
    });
}

TEST(MessageTypes, AreRegisteredUnderTheirPrefixAndName) {
    EXPECT_EQ(messageTypeOf<ConfigurationSet>.name(), "velkor/configuration/ConfigurationSet");
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
