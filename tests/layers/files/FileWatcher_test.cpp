#include <fcntl.h>
#include <gmock/gmock.h>

#include <cerrno>
#include <chrono>
#include <filesystem>
#include <fstream>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "tests/layers/files/FollowingStore.hpp"
#include "tests/layers/files/SystemHooks.hpp"
#include "tests/support/LogCapture.hpp"

namespace velkor::layers {
namespace {

namespace fs = std::filesystem;

using ::testing::ElementsAre;
using testing::FileFolder;
using ::testing::IsEmpty;
using testing::LogCapture;
using testing::OpenFile;
using testing::Refusal;
using testing::SystemHooks;

// The threads of this process that follow files, by their name.
std::ptrdiff_t threadCount() {
    std::ptrdiff_t count = 0;
    for (const auto& entry : fs::directory_iterator("/proc/self/task")) {
        std::string name;
        std::getline(std::ifstream(entry.path() / "comm"), name);
        if (name == "velkor-files") ++count;
    }
    return count;
}

std::ptrdiff_t inotifyCount() {
    std::ptrdiff_t count = 0;
    for (const auto& entry : fs::directory_iterator("/proc/self/fd")) {
        std::error_code gone;
        if (fs::read_symlink(entry, gone) == "anon_inode:inotify") ++count;
    }
    return count;
}

class FileWatcherTest : public ::testing::Test {
protected:
    // The watcher of the case before ends on its own thread when that holds the last file.
    void SetUp() override {
        ASSERT_TRUE(comesAbout([] { return inotifyCount() == 0; }));
    }

    // Follows by looks alone, whose interval is short enough for a test.
    static ReloadingFileOptions looking() {
        ReloadingFileOptions options;
        options.lookEvery = std::chrono::milliseconds(20);
        return options;
    }

    // What was said of the file.
    std::vector<std::string> messages() const {
        std::vector<std::string> about;
        for (auto& message : log.messages()) {
            if (message.find(path.string()) != std::string::npos) about.push_back(message);
        }
        return about;
    }

    FileFolder folder;
    const fs::path path = folder / "file";
    const LogCapture log{"velkor::files", common::error | common::warning};
};

TEST_F(FileWatcherTest, IsOneThreadAndOneInstanceForAllFiles) {
    FollowingStore following;
    for (int i = 0; i < 20; ++i) {
        const auto name = "file" + std::to_string(i);
        FileFolder::write(folder / name, name + "=0\n");
        following.follow(folder / name, {}, name);
    }
    for (int i = 0; i < 20; ++i) {
        const auto name = "file" + std::to_string(i);
        FileFolder::replace(folder / name, name + "=1\n");
        ASSERT_TRUE(following.isTold(name + "=1"));
    }

    EXPECT_EQ(threadCount(), 1);
    EXPECT_EQ(inotifyCount(), 1);
}

TEST_F(FileWatcherTest, EndsWithTheLastFile) {
    FileFolder::write(path, "key=1\n");
    auto first = std::make_shared<ReloadingFileSource>(path);
    auto second = std::make_shared<ReloadingFileSource>(path);

    first.reset();
    EXPECT_TRUE(comesAbout([] { return threadCount() == 1; }));
    second.reset();
    // A thread that was joined may be listed for a moment.
    EXPECT_TRUE(comesAbout([] { return threadCount() == 0; }));
    EXPECT_EQ(inotifyCount(), 0);
}

TEST_F(FileWatcherTest, BeginsAnewAfterItsEnd) {
    FileFolder::write(path, "key=0\n");
    for (const std::string text : {"key=1", "key=2"}) {
        FollowingStore following;
        following.follow(path);
        FileFolder::replace(path, text + "\n");
        EXPECT_TRUE(following.isTold(text));
    }
}

TEST_F(FileWatcherTest, EndsOnItsOwnThreadWithoutWaitingForItself) {
    FileFolder::write(path, "key=1\n");
    auto store = std::make_shared<configuration::ConfigurationImpl>();
    auto source = std::make_shared<ReloadingFileSource>(path);
    store->addSource("file", "", 5, true, source).get();
    testing::Latch ended;
    auto publisher = store->watchChanges("key");
    auto watching =
        reactive_streams::subscribe(*publisher, {[&](const configuration::OptionChange&) {
                                                     source.reset();
                                                     publisher.reset();
                                                     store.reset();
                                                     ended.countDown();
                                                 },
                                                 {},
                                                 {}});

    FileFolder::replace(path, "key=2\n");

    EXPECT_TRUE(ended.wait());
    EXPECT_TRUE(comesAbout([] { return inotifyCount() == 0; }));
}

TEST_F(FileWatcherTest, GoesOnWhenAListenerThrows) {
    FileFolder::write(path, "key=1\n");
    FollowingStore following;
    const auto source = following.follow(path);
    source->setChangeListener([](const std::string&) { throw std::runtime_error("unwilling"); });

    FileFolder::replace(path, "key=2\n");
    following.passFence();

    EXPECT_EQ(following.valueOf("key"), "2");
    EXPECT_THAT(messages(), ElementsAre("Property file could not be followed: " + path.string() +
                                        ": unwilling"));
}

TEST_F(FileWatcherTest, LooksAtFilesWhereTheSystemTellsNothing) {
    FileFolder::write(path, "key=1\n");
    const Refusal none(SystemHooks::inotifyRefused, EMFILE);
    FollowingStore following(looking());
    following.follow(path, looking());

    FileFolder::replace(path, "key=2\n");

    EXPECT_TRUE(following.isTold("key=2"));
    EXPECT_THAT(messages(),
                ElementsAre("Property file can't be watched and is looked at every 20 ms: " +
                            path.string() + ": Too many open files"));
}

TEST_F(FileWatcherTest, LooksAtFilesThatComeAndGo) {
    FileFolder::write(path, "key=1\n");
    const Refusal none(SystemHooks::inotifyRefused, EMFILE);
    FollowingStore following(looking());
    auto options = looking();
    options.forgetsUnreadable = true;
    following.follow(path, options);

    fs::remove(path);
    EXPECT_TRUE(following.isTold("key"));
    FileFolder::write(path, "key=2\n");
    EXPECT_TRUE(following.isTold("key=2"));
}

TEST_F(FileWatcherTest, WatchesAgainWhenTheSystemAllowsIt) {
    FileFolder::write(path, "key=1\n");
    FollowingStore following(looking());
    {
        const Refusal full(SystemHooks::watchRefused, ENOSPC);
        following.follow(path, looking());
        FileFolder::replace(path, "key=2\n");
        ASSERT_TRUE(following.isTold("key=2"));
    }
    ASSERT_TRUE(comesAbout([&] { return messages().size() >= 2; }));

    EXPECT_THAT(messages(),
                ElementsAre("Property file can't be watched and is looked at every 20 ms: " +
                                path.string() + ": No space left on device",
                            "Property file is watched again: " + path.string()));
}

TEST_F(FileWatcherTest, LooksAgainAfterTheSystemHasLostEvents) {
    FileFolder::write(path, "key=1\n");
    FollowingStore following;
    ReloadingFileOptions options;
    options.lookEvery = std::chrono::hours(1);
    const auto source = following.follow(path, options);
    testing::Latch inside;
    testing::Latch released;
    const auto holding = reactive_streams::subscribe(*following.store->watchChanges("key"),
                                                     {[&](const configuration::OptionChange&) {
                                                          inside.countDown();
                                                          EXPECT_TRUE(released.wait());
                                                      },
                                                      {},
                                                      {}});
    FileFolder::replace(path, "key=2\n");
    ASSERT_TRUE(inside.wait());
    for (int i = 0; i < 20'000; ++i) {
        FileFolder::write(folder / "other", "");
        fs::remove(folder / "other");
    }

    FileFolder::replace(path, "key=3\n");
    released.countDown();

    EXPECT_TRUE(following.isTold("key=3"));
}

}  // namespace
}  // namespace velkor::layers
