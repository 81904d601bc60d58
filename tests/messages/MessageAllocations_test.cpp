#include <gtest/gtest.h>

#include <cstddef>
#include <new>
#include <ostream>
#include <string>
#include <vector>

#include "tests/messages/RunningService.hpp"
#include "tests/support/AllocationCounter.hpp"

namespace velkor::messages {
namespace {

using velkor::testing::AllocationFailure;
using velkor::testing::outcomeOf;
using velkor::testing::RunningService;

struct Request {
    std::string name;
    std::string type;
    std::string json;
};

void PrintTo(const Request& request, std::ostream* out) {
    *out << request.type << ' ' << request.json.substr(0, 80);
}

class AnyAllocation : public ::testing::TestWithParam<Request> {
protected:
    DispatchResult send() const { return service.send(GetParam().type, GetParam().json); }

    RunningService service;
};

// A reply is complete or there is none: what fails half way is no shorter text.
TEST_P(AnyAllocation, ThatFailsPassesOnLackOfMemory) {
    const std::string expected = outcomeOf(send());
    for (std::size_t successes = 0;; ++successes) {
        std::string outcome = "lack of memory";
        bool failed = true;
        try {
            const AllocationFailure failure(successes);
            const DispatchResult result = send();
            failed = failure.hasHappened();
            outcome = failed ? "swallowed" : outcomeOf(result);
        } catch (const std::bad_alloc&) {
            failed = true;
        }
        if (!failed) {
            EXPECT_EQ(outcome, expected);
            EXPECT_GT(successes, 0U);
            return;
        }
        ASSERT_EQ(outcome, "lack of memory") << "after " << successes;
    }
}

const std::string longText(600, 'x');

const std::vector<Request> requests{
    {"Get", "ConfigurationGet", R"({"key":")" + longText + "\"}"},
    {"Set", "ConfigurationSet",
     R"({"key":"k","value":{"type":"stringArray","value":["a",")" + longText + R"("]}})"},
    {"SetOfWideText", "ConfigurationSet",
     R"({"key":"k","value":{"type":"ustring","value":"\u20ac)" + longText + "\"}}"},
    {"SetOfNumbers", "ConfigurationSet",
     R"({"key":"k","value":{"type":"doubleArray","value":["1,f)" + std::string(600, '0') +
         R"(",0.1,"x",null]}})"},
    {"Keys", "ConfigurationKeys", "{}"},
    {"ObjectAsKey", "ConfigurationGet", R"({"key":{"a":")" + longText + "\"}}"},
    {"ArrayAsValue", "ConfigurationSet",
     R"({"key":"k","value":{"type":"string","value":["a",")" + longText + R"("]}})"},
    {"AddPropertyFileSource", "AddPropertyFileSource", R"({"name":"override","path":"/dev/null"})"},
    {"UnknownType", "NoMessageOfANameThatIsLongerThanAShortText", "{}"},
    {"NoJson", "ConfigurationGet", R"({"key":)"},
};

INSTANTIATE_TEST_SUITE_P(Requests, AnyAllocation, ::testing::ValuesIn(requests),
                         [](const auto& tested) { return tested.param.name; });

}  // namespace
}  // namespace velkor::messages
