#pragma once

#include <gtest/gtest.h>

#include <algorithm>
#include <boost/variant/apply_visitor.hpp>
#include <boost/variant/get.hpp>
#include <cmath>
#include <cstddef>
#include <limits>
#include <stdexcept>
#include <string>
#include <type_traits>
#include <utility>
#include <vector>

#include "configuration/ConfigurationValue.hpp"
#include "layers/testing/SourceSubject.hpp"

namespace velkor::layers::testing::detail {

/// `value` with its kind, for people.
inline std::string describe(const configuration::ConfigurationValue& value) {
    const auto text = [](const auto& content) { return ::testing::PrintToString(content); };
    const auto kind = static_cast<std::size_t>(value.which());
    return std::string(configuration::typeTags[kind]) + " " + boost::apply_visitor(text, value);
}

template <class T>
bool isExactly(const T& actual, const T& expected) {
    return actual == expected;
}

inline bool isExactly(double actual, double expected) {
    if (std::isnan(expected)) return std::isnan(actual);
    return actual == expected && std::signbit(actual) == std::signbit(expected);
}

inline bool isExactly(const std::vector<double>& actual, const std::vector<double>& expected) {
    const auto same = [](double one, double other) { return isExactly(one, other); };
    return std::equal(actual.begin(), actual.end(), expected.begin(), expected.end(), same);
}

/// Whether `actual` is `expected`: of the same kind and with the same bits, but that one NaN is as
/// good as another.
inline ::testing::AssertionResult isSame(const configuration::ConfigurationValue& actual,
                                         const configuration::ConfigurationValue& expected) {
    const auto agrees = [&](const auto& content) {
        using Content = std::decay_t<decltype(content)>;
        const auto* const other = boost::get<Content>(&actual);
        return other != nullptr && isExactly(*other, content);
    };
    if (boost::apply_visitor(agrees, expected)) return ::testing::AssertionSuccess();
    return ::testing::AssertionFailure()
           << describe(actual) << " instead of " << describe(expected);
}

/// Values of all kinds, plain texts first. No two that follow each other are equal.
inline std::vector<configuration::ConfigurationValue> allSampleValues() {
    using Doubles = std::numeric_limits<double>;
    const std::string text("text with \0 in it", 17);
    const std::u16string wideText(u"text with \0 in it", 17);
    return {
        std::string("one"),
        std::string("two"),
        std::string("three"),
        std::string(),
        std::string("  blanks\taround \t "),
        std::string("lines\nand\r\nlines\n"),
        std::string("a=b:c #d !e \\f \\u0041"),
        std::string("\xE2\x82\xAC, \xF0\x9F\x8C\x8D"),
        std::string("not UTF-8: \xFF\xC0\x80"),
        text,
        false,
        true,
        0,
        std::numeric_limits<int>::min(),
        std::numeric_limits<int>::max(),
        0U,
        std::numeric_limits<unsigned>::max(),
        0.1,
        -0.0,
        Doubles::max(),
        Doubles::denorm_min(),
        -Doubles::infinity(),
        Doubles::quiet_NaN(),
        std::u16string(),
        std::u16string(u"one \u20AC"),
        std::u16string(1, char16_t{0xD800}),
        wideText,
        std::vector<bool>(),
        std::vector<bool>{true, false, true},
        std::vector<int>(),
        std::vector<int>{std::numeric_limits<int>::min(), 0, std::numeric_limits<int>::max()},
        std::vector<unsigned>(),
        std::vector<unsigned>{0U, std::numeric_limits<unsigned>::max()},
        std::vector<double>(),
        std::vector<double>{0.1, -0.0, Doubles::infinity()},
        std::vector<std::string>(),
        std::vector<std::string>{"", "one, two", text},
        std::vector<std::u16string>(),
        std::vector<std::u16string>{u"", u"one, two", wideText},
    };
}

/// Those sample values that the source of a subject can hold.
class SampleValues {
public:
    /// Throws `std::invalid_argument` "A source that holds fewer than two of the sample values
    /// can't be tried."
    explicit SampleValues(const SourceSubject& subject) {
        for (auto& value : allSampleValues()) {
            if (subject.canHold(value)) values.push_back(std::move(value));
        }
        if (values.size() < 2) {
            throw std::invalid_argument(
                "A source that holds fewer than two of the sample values can't be tried.");
        }
    }

    /// One of the values, for any `index`. Those of neighbours differ.
    const configuration::ConfigurationValue& operator[](std::size_t index) const {
        return values[index % values.size()];
    }

    std::size_t size() const { return values.size(); }

private:
    std::vector<configuration::ConfigurationValue> values;
};

}  // namespace velkor::layers::testing::detail
