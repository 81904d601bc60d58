#include <gtest/gtest.h>

#include <memory>
#include <string>

#include "configuration/sources/PropertyFileSource.hpp"
#include "tests/configuration/StoreTesting.hpp"
#include "tests/support/AllocationCounter.hpp"
#include "tests/support/ScarceMemory.hpp"

#include <malloc.h>

namespace velkor::configuration {
namespace {

using testing::countAllocations;

// A resolved future is two allocations: its shared state and the boxed result.
constexpr std::size_t oneFuture = 2;

class StoreAllocations : public testing::StoreTest {
protected:
    void SetUp() override { store->set("a", 1); }
};

TEST_F(StoreAllocations, GetFromTheFirstSourceMakesItsFutureOnly) {
    EXPECT_EQ(countAllocations([&] { store->get("a"); }), oneFuture);
}

TEST_F(StoreAllocations, TakingTheAnswerMakesNone) {
    auto answer = store->get("a");
    EXPECT_EQ(countAllocations([&] { answer.get(); }), 0U);
}

TEST_F(StoreAllocations, GetOfAShortTextMakesItsFutureOnly) {
    store->set("text", std::string("short"));
    EXPECT_EQ(countAllocations([&] { store->get("text"); }), oneFuture);
}

TEST_F(StoreAllocations, HasMakesItsFutureOnly) {
    EXPECT_EQ(countAllocations([&] { store->has("a"); }), oneFuture);
    EXPECT_EQ(countAllocations([&] { store->has("missing"); }), oneFuture);
}

TEST_F(StoreAllocations, GetOptionOfShortNamesMakesItsFutureOnly) {
    EXPECT_EQ(countAllocations([&] { store->getOption("a"); }), oneFuture);
}

TEST_F(StoreAllocations, OverwritingMakesItsFutureOnly) {
    const std::string key = "a";
    EXPECT_EQ(countAllocations([&] { store->set(key, 2); }), oneFuture);
}

TEST_F(StoreAllocations, GetFromTheLastSourceMakesItsFutureOnly) {
    store->set("last", 1, "default");
    EXPECT_EQ(countAllocations([&] { store->get("last"); }), oneFuture);
}

TEST_F(StoreAllocations, GetThroughSixteenGroupsMakesItsFutureOnlyOnceWarm) {
    const std::string group = "a.group.that.is.long";
    const std::string key = group + ".and.a.key.that.is.longer.than.a.short.string";
    for (int number = 0; number < 16; ++number) {
        add("source" + std::to_string(number), number % 2 == 0 ? group : "a.group", number + 1, {});
    }
    store->set(key, 1, "default");
    store->get(key);
    EXPECT_EQ(countAllocations([&] { store->get(key); }), oneFuture);
    EXPECT_EQ(countAllocations([&] { store->has(key); }), oneFuture);
}

TEST_F(StoreAllocations, FailedAllocationLeavesTheStoreUsable) {
    const std::string key = "a";
    bool failed = true;
    for (std::size_t successes = 0; failed; ++successes) {
        const testing::AllocationFailure failure(successes);
        try {
            store->get(key);
        } catch (const std::bad_alloc&) {
        }
        failed = failure.hasHappened();
    }
    EXPECT_EQ(valueOf("a"), "int 1");
}

TEST_F(StoreAllocations, FailedAllocationDuringAWriteKeepsOneOfTheTwoValues) {
    const std::string key = "a key that is longer than a short string";
    store->set(key, std::string(100, 'x'));
    const ConfigurationValue value(std::string(200, 'y'));
    bool failed = true;
    for (std::size_t successes = 0; failed; ++successes) {
        {
            const testing::AllocationFailure failure(successes);
            try {
                store->set(key, value);
            } catch (const std::bad_alloc&) {
            }
            failed = failure.hasHappened();
        }
        const std::string held = boost::get<std::string>(store->get(key).get());
        EXPECT_TRUE(held == std::string(100, 'x') || held == std::string(200, 'y'));
    }
    EXPECT_EQ(valueOf(key), "string " + std::string(200, 'y'));
}

TEST_F(StoreAllocations, FailedAllocationDuringARegistrationIsAllOrNothing) {
    bool failed = true;
    for (std::size_t successes = 0; failed; ++successes) {
        {
            const testing::AllocationFailure failure(successes);
            try {
                store->addInMemorySource("extra", "net", 5, false, {});
            } catch (const std::bad_alloc&) {
            }
            failed = failure.hasHappened();
        }
        EXPECT_EQ(valueOf("a"), "int 1");
        store->removeSource("extra");
        EXPECT_EQ(names().size(), 2U);
    }
}

// Bytes that the program has allocated and not given back.
std::size_t allocatedBytes() {
    const struct mallinfo2 heap = ::mallinfo2();
    return heap.uordblks + heap.hblkhd;
}

TEST_F(StoreAllocations, MillionKeysCostHardlyMoreThanABareTable) {
    constexpr int keyCount = 1'000'000;
    const auto fill = [](auto&& insert) {
        for (int number = 0; number < keyCount; ++number) {
            insert("some.group.key" + std::to_string(number), number);
        }
    };
    std::size_t before = allocatedBytes();
    std::size_t bare = 0;
    {
        ValueMap table;
        fill([&](const std::string& key, int value) { table.emplace(key, value); });
        bare = allocatedBytes() - before;
    }
    before = allocatedBytes();
    fill([&](const std::string& key, int value) { store->set(key, value); });
    const std::size_t held = allocatedBytes() - before;
    EXPECT_GT(bare, static_cast<std::size_t>(keyCount) * sizeof(ConfigurationValue));
    EXPECT_LT(static_cast<double>(held), 1.3 * static_cast<double>(bare));
}

std::string manyProperties(int count) {
    std::string text;
    for (int number = 0; number < count; ++number) {
        text += "# a comment\nsome.group.key" + std::to_string(number) + " = 4711\n";
    }
    return text;
}

TEST_F(StoreAllocations, KeyOfAPropertyFileCostsAtMost100BytesWithItsText) {
    // One more than fit into the index at half its size.
    constexpr int keyCount = (1 << 17) + 1;
    const std::string text = manyProperties(keyCount);
    const std::size_t before = allocatedBytes();
    const PropertyFileSource source(PropertyText{text});
    EXPECT_LT(allocatedBytes() - before, std::size_t{100} * keyCount);
}

TEST_F(StoreAllocations, KeyOfAPropertyFileTakesNoBlockOfItsOwn) {
    const std::string text = manyProperties(10'000);
    EXPECT_LT(countAllocations([&] { const PropertyFileSource source(PropertyText{text}); }), 100U);
}

TEST_F(StoreAllocations, GetOfAShortTextOfAPropertyFileMakesItsFutureOnly) {
    store->addSource("file", "", -1, true,
                     std::make_shared<PropertyFileSource>(PropertyText{"text = short\n"}));
    EXPECT_EQ(countAllocations([&] { store->get("text"); }), oneFuture);
}

TEST_F(StoreAllocations, FailedAllocationWhileAPropertyFileIsParsedLosesNoBlock) {
    const std::string text = manyProperties(100);
    testing::failEachAllocation([&](testing::ScarceMemory& memory) {
        memory.allows([&] {
            PropertyFileSource source(PropertyText{text});
            EXPECT_TRUE(source.has("some.group.key99"));
        });
    });
}

}  // namespace
}  // namespace velkor::configuration
