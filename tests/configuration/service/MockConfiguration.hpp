#pragma once

#include <gmock/gmock.h>

#include <memory>
#include <ostream>
#include <set>
#include <string>

#include "configuration/Configuration.hpp"
#include "tests/support/ValueText.hpp"

namespace boost {

/// Found by Google Test as the printer of values, which are variants.
inline void PrintTo(const velkor::configuration::ConfigurationValue& value, std::ostream* out) {
    *out << velkor::testing::textOf(value);
}

}  // namespace boost

namespace velkor::testing {

/// A store that does what a test tells it to.
class MockConfiguration : public configuration::Configuration {
public:
    using Value = configuration::ConfigurationValue;
    using Stream = std::shared_ptr<reactive_streams::PublisherAPI<Value>>;

    MOCK_METHOD(Future<Value>, get, (const std::string&), (override));
    MOCK_METHOD(Future<configuration::Option>, getOption, (const std::string&), (override));
    MOCK_METHOD(Future<Value>, set, (const std::string&, Value), (override));
    MOCK_METHOD(Future<Value>, set, (const std::string&, Value, const std::string&), (override));
    MOCK_METHOD(Future<bool>, has, (const std::string&), (override));
    MOCK_METHOD(Future<std::set<std::string>>, keys, (), (override));
    MOCK_METHOD(Stream, watchOption, (const std::string&), (override));
    MOCK_METHOD(Future<bool>, addPropertyFileSource,
                (const std::string&, const std::string&, int, bool, const std::u16string&),
                (override));
    MOCK_METHOD(Future<bool>, addInMemorySource,
                (const std::string&, const std::string&, int, bool, configuration::ValueMap&&),
                (override));
    MOCK_METHOD(Future<bool>, addEnvironmentSource, (const std::string&, const std::string&, int),
                (override));
    MOCK_METHOD(Future<bool>, removeSource, (const std::string&), (override));
    MOCK_METHOD(std::shared_ptr<configuration::Configuration>, getPtr, (), (override));
};

}  // namespace velkor::testing
