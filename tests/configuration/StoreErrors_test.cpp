#include "configuration/StoreErrors.hpp"

#include <gtest/gtest.h>

#include <exception>
#include <functional>
#include <memory>
#include <ostream>
#include <stdexcept>
#include <string>
#include <typeinfo>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "framework/RoutingErrors.hpp"

namespace velkor::configuration {

namespace {

/// A call that the store refuses.
struct RefusedCall {
    const char* name;
    std::function<void(ConfigurationImpl&)> call;
    Refusal expected;
};

std::ostream& operator<<(std::ostream& out, const RefusedCall& refused) {
    return out << refused.name;
}

const std::vector<RefusedCall>& refusedCalls() {
    static const std::vector<RefusedCall> calls{
        {"Get", [](auto& store) { store.get("k").get(); }, Refusal::missingOption},
        {"GetOption", [](auto& store) { store.getOption("k").get(); }, Refusal::missingOption},
        {"Set",
         [](auto& store) {
             store.removeSource("override");
             store.removeSource("default");
             store.set("k", 1).get();
         },
         Refusal::notWritable},
        {"SetByName", [](auto& store) { store.set("k", 1, "nobody").get(); }, Refusal::notWritable},
        {"SetInFile",
         [](auto& store) {
             store.addPropertyFileSource("file", "", -1, false, u"/dev/null").get();
             store.set("k", 1).get();
         },
         Refusal::notWritable},
        {"DuplicateSource",
         [](auto& store) { store.addInMemorySource("override", "", 0, false, {}).get(); },
         Refusal::duplicateSource},
        {"MissingFile",
         [](auto& store) { store.addPropertyFileSource("f", "", 0, true, u"/nobody/here").get(); },
         Refusal::fileNotOpened},
        {"NullSource", [](auto& store) { store.addSource("n", "", 0, true, nullptr).get(); },
         Refusal::other},
    };
    return calls;
}

class RefusalOf : public ::testing::TestWithParam<RefusedCall> {};

TEST_P(RefusalOf, ACallOfTheStoreIsItsKind) {
    const auto store = std::make_shared<ConfigurationImpl>();
    try {
        GetParam().call(*store);
        FAIL() << "not refused";
    } catch (const std::exception& error) {
        EXPECT_EQ(refusalOf(error), GetParam().expected) << error.what();
    }
}

INSTANTIATE_TEST_SUITE_P(Store, RefusalOf, ::testing::ValuesIn(refusedCalls()),
                         [](const auto& row) { return row.param.name; });

TEST(RefusalOfText, RoutingErrorsAreTheirKind) {
    EXPECT_EQ(refusalOf(std::runtime_error(routing_errors::notRunning)), Refusal::notRunning);
    EXPECT_EQ(refusalOf(std::invalid_argument(routing_errors::notForThisService)),
              Refusal::misrouted);
    EXPECT_EQ(refusalOf(std::invalid_argument(routing_errors::notForThisObject)),
              Refusal::misrouted);
}

TEST(RefusalOfText, HelpersOfDerivedStoresAreMissingOptions) {
    EXPECT_EQ(refusalOf(std::runtime_error(std::string(store_errors::noOptionValue) + "k")),
              Refusal::missingOption);
    EXPECT_EQ(refusalOf(std::runtime_error(std::string(store_errors::noOption) + "k")),
              Refusal::missingOption);
}

TEST(RefusalOfText, FilesFromElsewhereAreTheirKind) {
    EXPECT_EQ(refusalOf(std::runtime_error(std::string(store_errors::fileNotAllowed) + "/f")),
              Refusal::fileNotAllowed);
}

TEST(RefusalOfText, TheSameTextOfAnotherTypeIsSomethingElse) {
    class Derived : public std::runtime_error {
    public:
        using std::runtime_error::runtime_error;
    };
    const std::string text = std::string(store_errors::noSuchOption) + "k";
    EXPECT_EQ(refusalOf(std::invalid_argument(text)), Refusal::other);
    EXPECT_EQ(refusalOf(Derived(text)), Refusal::other);
}

TEST(RefusalOfText, AnotherTextIsSomethingElse) {
    EXPECT_EQ(refusalOf(std::runtime_error("No option")), Refusal::other);
    EXPECT_EQ(refusalOf(std::runtime_error("")), Refusal::other);
    EXPECT_EQ(refusalOf(std::bad_alloc()), Refusal::other);
}

}  // namespace

}  // namespace velkor::configuration
