#include <gtest/gtest.h>
#include <sys/stat.h>

#include <atomic>
#include <filesystem>
#include <fstream>
#include <functional>
#include <string>
#include <thread>
#include <vector>

#include "tests/configuration/StoreTesting.hpp"
#include "tests/support/BoundedWait.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::configuration {
namespace {

using testing::failureOf;
using testing::textOf;

class StoreConcurrency : public testing::StoreTest {
protected:
    static constexpr int rounds = 400;

    // Runs every action `rounds` times, each on a thread of its own, all starting together.
    static void race(const std::vector<std::function<void(int round)>>& actions) {
        testing::Latch start(actions.size());
        std::vector<std::thread> threads;
        for (const auto& action : actions) {
            threads.emplace_back([&] {
                EXPECT_TRUE(start.arriveAndWait());
                for (int round = 0; round < rounds; ++round) action(round);
            });
        }
        for (auto& thread : threads) thread.join();
    }
};

TEST_F(StoreConcurrency, ReadersSeeWholeValues) {
    const std::string first(200, 'x');
    const std::string second(300, 'y');
    store->set("a", first);
    std::atomic<int> torn{0};
    const auto read = [&](int) {
        const auto text = boost::get<std::string>(store->get("a").get());
        if (text != first && text != second) ++torn;
    };
    race({read, read, [&](int round) { store->set("a", round % 2 == 0 ? first : second); }});
    EXPECT_EQ(torn, 0);
}

TEST_F(StoreConcurrency, WritesNeverInterleave) {
    store->set("count", 0);
    std::atomic<int> sum{0};
    // Each write answers what it replaced: every value is replaced exactly once.
    const auto write = [&](int) { sum += boost::get<int>(store->set("count", 1).get()); };
    race({write, write, write});
    EXPECT_EQ(sum, 3 * rounds - 1);
}

TEST_F(StoreConcurrency, WritersOfDifferentKeysLoseNothing) {
    const auto writer = [&](const std::string& name) {
        return [this, name](int round) { store->set(name + std::to_string(round), round); };
    };
    race({writer("a"), writer("b"), writer("c")});
    EXPECT_EQ(store->keys().get().size(), 3U * rounds);
}

TEST_F(StoreConcurrency, SourcesComeAndGoUnderReaders) {
    store->set("a", 0, "default");
    std::atomic<int> wrong{0};
    const auto churn = [&](const std::string& name) {
        return [this, &wrong, name](int round) {
            if (!store->addInMemorySource(name, "", 5, false, {{"a", round}}).get()) ++wrong;
            if (!store->removeSource(name).get()) ++wrong;
        };
    };
    const auto read = [&](int) {
        if (!store->has("a").get() || store->get("a").get().which() != 1) ++wrong;
        if (store->keys().get().size() != 1) ++wrong;
        if (store->getOption("a").get().source.empty()) ++wrong;
        if (store->explain("a").get().empty()) ++wrong;
    };
    race({churn("one"), churn("two"), read});
    EXPECT_EQ(wrong, 0);
    EXPECT_EQ(store->describeSources().get().size(), 2U);
}

TEST_F(StoreConcurrency, OneNameIsTakenOnce) {
    std::atomic<int> added{0};
    const auto claim = [&](int round) {
        auto answer = store->addInMemorySource(std::to_string(round), "", 5, false, {});
        if (failureOf(std::move(answer)).empty()) ++added;
    };
    race({claim, claim, claim});
    EXPECT_EQ(added, rounds);
}

TEST_F(StoreConcurrency, OneSourceIsRemovedOnce) {
    for (int round = 0; round < rounds; ++round) add(std::to_string(round), "net", 5, {{"k", 1}});
    std::atomic<int> removed{0};
    const auto remove = [&](int round) {
        if (store->removeSource(std::to_string(round)).get()) ++removed;
    };
    race({remove, remove, remove});
    EXPECT_EQ(removed, rounds);
}

TEST_F(StoreConcurrency, GroupedReadsKeepTheirKeysApart) {
    add("one", "one", 5, {{"a", 1}, {"longer", 11}});
    add("two", "two", 6, {{"a", 2}, {"longer", 22}});
    std::atomic<int> wrong{0};
    const auto reader = [&](const std::string& key, const std::string& expected) {
        return [this, &wrong, key, expected](int) {
            if (textOf(store->get(key).get()) != expected) ++wrong;
        };
    };
    race({reader("one.a", "int 1"), reader("two.a", "int 2"), reader("one.longer", "int 11"),
          reader("two.longer", "int 22")});
    EXPECT_EQ(wrong, 0);
}

TEST_F(StoreConcurrency, SourceThatChangesByItselfMayReportAtAnyTime) {
    const auto source = addHooked("extra", "app", 5, {{"a", 1}});
    const auto listener = source->listener;
    race({[&](int) { listener("a"); }, [&](int) { store->get("app.a"); },
          [&](int) { store->watchOption("app.a"); }});
    EXPECT_EQ(valueOf("app.a"), "int 1");
}

TEST_F(StoreConcurrency, StoreMayBeDroppedByWhicheverThreadIsLast) {
    for (int round = 0; round < 50; ++round) {
        auto shared = std::make_shared<ConfigurationImpl>();
        std::vector<std::thread> threads;
        for (int number = 0; number < 3; ++number) {
            threads.emplace_back([store = shared, number] { store->set("a", number); });
        }
        shared.reset();
        for (auto& thread : threads) thread.join();
    }
}

TEST_F(StoreConcurrency, PropertyFileIsReadWithoutTheMutex) {
    // A pipe: whoever opens it to read waits until somebody opens it to write.
    const testing::TemporaryFile file("");
    std::filesystem::remove(file.path());
    ASSERT_EQ(::mkfifo(file.path().c_str(), 0600), 0);
    std::thread adding([&] { store->addPropertyFileSource("pipe", "", 5, true, file.widePath()); });
    std::ofstream pipe(file.path());  // returns once the other thread is reading
    EXPECT_TRUE(testing::completes([shared = store] { shared->has("a"); }));
    pipe << "a=1\n";
    pipe.close();
    adding.join();
    EXPECT_EQ(textOf(store->get("a").get()), "string 1");
}

}  // namespace
}  // namespace velkor::configuration
