#include <Poco/DateTime.h>
#include <Poco/Dynamic/Var.h>
#include <Poco/JSON/Array.h>
#include <Poco/JSON/Object.h>
#include <gtest/gtest.h>

#include <cmath>
#include <functional>
#include <limits>
#include <new>
#include <optional>
#include <string>
#include <vector>

#include "configuration/ConfigurationValue.hpp"
#include "tests/configuration/service/JsonForms.hpp"

namespace velkor::configuration {
namespace {

/// Content that can't be converted to a number, in the way that its function decides.
struct Unconvertible {
    std::function<void()> refuse;
};

}  // namespace
}  // namespace velkor::configuration

template <>
class Poco::Dynamic::VarHolderImpl<velkor::configuration::Unconvertible> : public VarHolder {
public:
    explicit VarHolderImpl(const velkor::configuration::Unconvertible& content) : value(content) {}
    const std::type_info& type() const override { return typeid(value); }
    void convert(Int32&) const override { value.refuse(); }
    VarHolder* clone(Placeholder<VarHolder>* place = nullptr) const override {
        return cloneHolder(place, value);
    }

private:
    velkor::configuration::Unconvertible value;
};

namespace velkor::configuration {
namespace {

using Poco::Dynamic::Var;
using velkor::testing::JsonForms;

constexpr double infinity = std::numeric_limits<double>::infinity();
constexpr double notANumber = std::numeric_limits<double>::quiet_NaN();

/// What the scalar kind `T` reads from a value that a host has put together by itself.
template <class T>
T readAs(const Var& content) {
    Poco::JSON::Object::Ptr value = new Poco::JSON::Object;
    value->set("type",
               std::string(typeTags.at(static_cast<std::size_t>(ConfigurationValue(T()).which()))));
    value->set("value", content);
    Poco::JSON::Object::Ptr message = new Poco::JSON::Object;
    message->set("value", value);
    return boost::get<T>(JsonForms().fromObject<ConfigurationSet>(message)->value);
}

/// What POCO converts `content` to; nothing when it refuses.
template <class T>
std::optional<T> convertedByPoco(const Var& content) {
    try {
        return content.convert<T>();
    } catch (const Poco::Exception&) {
        return std::nullopt;
    }
}

struct Content {
    std::string name;
    Var content;
};

void PrintTo(const Content& content, std::ostream* out) {
    *out << content.name;
}

class ConversionOfContent : public ::testing::TestWithParam<Content> {
protected:
    template <class T>
    void expectAsPocoOrDefault() {
        EXPECT_EQ(readAs<T>(GetParam().content),
                  convertedByPoco<T>(GetParam().content).value_or(T()));
    }
};

TEST_P(ConversionOfContent, ToIntFollowsPoco) {
    expectAsPocoOrDefault<int>();
}

TEST_P(ConversionOfContent, ToUnsignedFollowsPoco) {
    expectAsPocoOrDefault<unsigned int>();
}

TEST_P(ConversionOfContent, ToDoubleFollowsPoco) {
    expectAsPocoOrDefault<double>();
}

TEST_P(ConversionOfContent, ToTextFollowsPoco) {
    expectAsPocoOrDefault<std::string>();
}

TEST_P(ConversionOfContent, ToBoolFollowsPoco) {
    expectAsPocoOrDefault<bool>();
}

template <class T>
Content content(const std::string& name, const T& value) {
    return {name, Var(value)};
}

const std::vector<Content> contents{
    content("Bool", true),
    content("Character", 'x'),
    content("Int8", Poco::Int8(-5)),
    content("UInt8", Poco::UInt8(200)),
    content("Int16", Poco::Int16(-300)),
    content("UInt16", Poco::UInt16(65535)),
    content("Int", -7),
    content("Unsigned", 4000000000u),
    content("LeastInt64", std::numeric_limits<Poco::Int64>::min()),
    content("GreatestInt64", std::numeric_limits<Poco::Int64>::max()),
    content("GreatestUInt64", std::numeric_limits<Poco::UInt64>::max()),
    content("Float", 2.5f),
    content("NegativeFloat", -2.5f),
    content("LeastIntAsInt64", Poco::Int64(-2147483648)),
    content("LeastIntAsDouble", -2147483648.0),
    content("GreatestIntAsDouble", 2147483647.0),
    content("MinusHalf", -0.5),
    content("MinusOneAsDouble", -1.0),
    content("MinusOneAsFloat", -1.0f),
    content("GreatestUnsignedAsDouble", 4294967295.0),
    content("GreatestDouble", std::numeric_limits<double>::max()),
    content("LowestDouble", std::numeric_limits<double>::lowest()),
    content("Date", Poco::DateTime(2001, 2, 3)),
    content("TimeStamp", Poco::Timestamp(1000)),
    content("ObjectByValue", Poco::JSON::Object()),
    content("ArrayByValue", Poco::JSON::Array()),
    content("NullObject", Poco::JSON::Object::Ptr()),
    content("NullArray", Poco::JSON::Array::Ptr()),
    content("VectorOfVar", std::vector<Var>{1, 2}),
};

INSTANTIATE_TEST_SUITE_P(Var, ConversionOfContent, ::testing::ValuesIn(contents),
                         [](const auto& tested) { return tested.param.name; });

TEST(ConversionOfNonFiniteNumbers, ToAnIntegerGivesTheDefault) {
    for (const double number : {infinity, -infinity, notANumber}) {
        EXPECT_EQ(readAs<int>(number), 0);
        EXPECT_EQ(readAs<unsigned int>(number), 0U);
        EXPECT_EQ(readAs<int>(static_cast<float>(number)), 0);
        EXPECT_EQ(readAs<unsigned int>(static_cast<float>(number)), 0U);
    }
}

TEST(ConversionOfNonFiniteNumbers, ToADoubleKeepsThem) {
    EXPECT_EQ(readAs<double>(infinity), infinity);
    EXPECT_EQ(readAs<double>(-infinity), -infinity);
    EXPECT_TRUE(std::isnan(readAs<double>(notANumber)));
}

TEST(ConversionOfNonFiniteNumbers, ToABoolIsTrue) {
    EXPECT_TRUE(readAs<bool>(infinity));
    EXPECT_TRUE(readAs<bool>(notANumber));
}

// A float has no digits left between the greatest int and this number.
TEST(ConversionOfFloats, BeyondTheIntegersGivesTheDefault) {
    EXPECT_EQ(readAs<int>(2147483648.0f), 0);
    EXPECT_EQ(readAs<int>(-2147483648.0f), 0);
    EXPECT_EQ(readAs<unsigned int>(4294967296.0f), 0U);
}

TEST(FailedConversion, OfAnyExceptionGivesTheDefault) {
    EXPECT_EQ(readAs<int>(Unconvertible{[] { throw 5; }}), 0);
    EXPECT_EQ(readAs<int>(Unconvertible{[] { throw std::runtime_error("no"); }}), 0);
}

TEST(FailedConversion, ForLackOfMemoryPassesOn) {
    EXPECT_THROW(readAs<int>(Unconvertible{[] { throw std::bad_alloc(); }}), std::bad_alloc);
}

}  // namespace
}  // namespace velkor::configuration
