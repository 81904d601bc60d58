// Files that are followed by a thread that is short of memory.

#include <gtest/gtest.h>

#include <boost/variant/get.hpp>
#include <chrono>
#include <cstddef>
#include <filesystem>
#include <fstream>
#include <memory>
#include <string>
#include <thread>

#include "layers/files/ReloadingFileSource.hpp"
#include "tests/layers/files/FollowingStore.hpp"
#include "tests/support/ScarceMemory.hpp"

namespace velkor::layers {
namespace {

using testing::AllocationFailureElsewhere;
using testing::Shortage;

class FilesShortOfMemory : public ::testing::TestWithParam<Shortage> {
protected:
    FilesShortOfMemory() { options.lookEvery = std::chrono::milliseconds(5); }

    /// Does `act` with the n-th allocation of the thread failing, n = 1, 2, ... until `isDone`
    /// holds without one. The shortage is over when it has been met; then `isDone` has to come
    /// about.
    template <class Act, class Condition>
    static void expectDoneAfter(Act act, Condition isDone) {
        bool ranOut = true;
        for (std::size_t successes = 0; ranOut && !HasFailure(); ++successes) {
            SCOPED_TRACE(successes);
            {
                const AllocationFailureElsewhere failure(successes, GetParam());
                act(successes);
                while (!failure.hasHappened() && !isDone(successes)) std::this_thread::yield();
                ranOut = failure.hasHappened();
            }
            EXPECT_TRUE(comesAbout([&] { return isDone(successes); }));
        }
    }

    /// How many files and folders the process is told of.
    static std::size_t watches() {
        std::size_t count = 0;
        for (const auto& entry : std::filesystem::directory_iterator("/proc/self/fdinfo")) {
            std::ifstream lines(entry.path());
            for (std::string line; std::getline(lines, line);) {
                if (line.rfind("inotify wd:", 0) == 0) ++count;
            }
        }
        return count;
    }

    static std::string text(std::size_t number) { return "value " + std::to_string(number); }

    const testing::FileFolder folder;
    ReloadingFileOptions options;
    FollowingStore store{options};
};

TEST_P(FilesShortOfMemory, AreReadAgainAllTheSame) {
    testing::FileFolder::write(folder / "file", "key=value\n");
    const auto source = store.follow(folder / "file", options);
    expectDoneAfter(
        [&](std::size_t number) {
            testing::FileFolder::replace(folder / "file", "key=" + text(number) + '\n');
        },
        [&](std::size_t number) {
            return boost::get<std::string>(source->get("key")) == text(number);
        });
    EXPECT_TRUE(source->state().isWell);
}

TEST_P(FilesShortOfMemory, LeaveNoWatchBehind) {
    testing::FileFolder::write(folder / "file", "key=value\n");
    const std::size_t before = watches();
    store.follow(folder / "file", options);
    const std::size_t all = watches();
    ASSERT_GT(all, before);
    store.store->removeSource("file").get();
    ASSERT_TRUE(comesAbout([&] { return watches() == before; }));
    bool ranOut = true;
    for (std::size_t successes = 0; ranOut && !HasFailure(); ++successes) {
        SCOPED_TRACE(successes);
        {
            const AllocationFailureElsewhere failure(successes, GetParam());
            store.store->addSource("file", "", 5, true,
                                   std::make_shared<ReloadingFileSource>(folder / "file", options));
            while (!failure.hasHappened() && watches() != all) std::this_thread::yield();
            ranOut = failure.hasHappened();
        }
        store.store->removeSource("file").get();
        EXPECT_TRUE(comesAbout([&] { return watches() == before; }));
    }
}

INSTANTIATE_TEST_SUITE_P(Shortages, FilesShortOfMemory,
                         ::testing::Values(Shortage::once, Shortage::lasting),
                         testing::nameOfShortage);

}  // namespace
}  // namespace velkor::layers
