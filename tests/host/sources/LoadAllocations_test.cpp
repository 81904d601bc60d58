#include <gtest/gtest.h>

#include <cstddef>
#include <memory>
#include <new>
#include <string>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "host/sources/SourceLoader.hpp"
#include "tests/support/AllocationCounter.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::host {
namespace {

using velkor::testing::AllocationFailure;
using Words = std::vector<std::string>;

TEST(LoadAllocations, OneThatFailsIsReportedWithTheLocation) {
    const velkor::testing::TemporaryFile file("a=1\n");
    const std::string path = file.path().string();
    const std::vector<SourceRequest> requests{{"n", path}};
    std::size_t reports = 0;
    bool hasFailed = true;
    for (std::size_t successes = 0; hasFailed; ++successes) {
        const auto store = std::make_shared<configuration::ConfigurationImpl>();
        Words texts;
        try {
            const AllocationFailure failure(successes);
            texts = loadSources(*store, requests, {}).failures;
            hasFailed = failure.hasHappened();
        } catch (const std::bad_alloc&) {
            continue;  // before the first request
        }
        if (!hasFailed) break;
        ++reports;
        EXPECT_EQ(texts, Words{"Out of memory while loading: " + path});
    }
    EXPECT_GT(reports, 5U);
}

}  // namespace
}  // namespace velkor::host
