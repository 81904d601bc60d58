#pragma once

#include <gtest/gtest.h>

#include <memory>
#include <set>
#include <string>
#include <vector>

#include "configuration/ConfigurationValue.hpp"
#include "configuration/Option.hpp"
#include "framework/Message.hpp"

namespace velkor::testing {

/// A message that can be told from others.
struct NumberedMessage : Message {
    explicit NumberedMessage(int id) : number(id) {}
    int number;
};

/// For each result type that the library uses: a way to make the value of the tests, and to
/// recognise it.
template <class T>
struct ResultSample;

template <>
struct ResultSample<configuration::ConfigurationValue> {
    static constexpr const char* name = "ConfigurationValue";
    static configuration::ConfigurationValue make() { return std::vector<int>{3, 1, 4}; }
    static bool matches(const configuration::ConfigurationValue& value) { return value == make(); }
};

template <>
struct ResultSample<configuration::Option> {
    static constexpr const char* name = "Option";
    static configuration::Option make() { return {"some.key", "override", std::u16string(u"x")}; }
    static bool matches(const configuration::Option& option) {
        return option.key == make().key && option.source == make().source &&
               option.value == make().value;
    }
};

template <>
struct ResultSample<bool> {
    static constexpr const char* name = "Bool";
    static bool make() { return true; }
    static bool matches(bool value) { return value; }
};

template <>
struct ResultSample<std::set<std::string>> {
    static constexpr const char* name = "SetOfStrings";
    static std::set<std::string> make() { return {"a.first", "b.second"}; }
    static bool matches(const std::set<std::string>& keys) { return keys == make(); }
};

template <>
struct ResultSample<std::unique_ptr<Message>> {
    static constexpr const char* name = "Message";
    static std::unique_ptr<Message> make() { return std::make_unique<NumberedMessage>(7); }
    static bool matches(const std::unique_ptr<Message>& message) {
        const auto* numbered = dynamic_cast<const NumberedMessage*>(message.get());
        return numbered != nullptr && numbered->number == 7;
    }
};

using ResultTypes = ::testing::Types<configuration::ConfigurationValue, configuration::Option, bool,
                                     std::set<std::string>, std::unique_ptr<Message>>;

/// Names the cases of a suite over `ResultTypes`.
struct ResultNames {
    template <class T>
    static std::string GetName(int) {
        return ResultSample<T>::name;
    }
};

}  // namespace velkor::testing
