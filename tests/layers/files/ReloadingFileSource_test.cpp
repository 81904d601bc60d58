#include "layers/files/ReloadingFileSource.hpp"

#include <gmock/gmock.h>
#include <sys/stat.h>

#include <cerrno>
#include <chrono>
#include <filesystem>
#include <functional>
#include <memory>
#include <stdexcept>
#include <string>
#include <vector>

#include "tests/layers/ProcessEnd.hpp"
#include "tests/layers/files/FollowingStore.hpp"
#include "tests/layers/files/SystemHooks.hpp"
#include "tests/support/LogCapture.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::layers {
namespace {

namespace fs = std::filesystem;

using configuration::ConfigurationValue;
using ::testing::Contains;
using ::testing::ElementsAre;
using testing::FileFolder;
using ::testing::IsEmpty;
using testing::LogCapture;
using ::testing::Not;
using testing::OpenFile;
using testing::Refusal;
using testing::SystemHooks;
using testing::thrownText;
using ::testing::UnorderedElementsAre;

class ReloadingFileSourceTest : public ::testing::Test {
protected:
    static std::string textOf(const ConfigurationValue& value) {
        return boost::get<std::string>(value);
    }

    std::string refusal(const fs::path& given, const ReloadingFileOptions& options = {}) {
        return thrownText<std::runtime_error>([&] { ReloadingFileSource(given, options); });
    }

    static ReloadingFileOptions mayBeUnreadable() {
        ReloadingFileOptions options;
        options.mustBeReadable = false;
        return options;
    }

    static ReloadingFileOptions forgetting() {
        ReloadingFileOptions options;
        options.forgetsUnreadable = true;
        return options;
    }

    std::string problemOf(const ReloadingFileSource& source) {
        const auto problem = source.status().problem;
        return problem ? problem->text : "";
    }

    FileFolder folder;
    const fs::path path = folder / "file";
    FollowingStore following;
};

TEST_F(ReloadingFileSourceTest, HoldsThePropertiesOfTheFile) {
    FileFolder::write(path, "a = 1\nb = two words\n");

    ReloadingFileSource source(path);

    EXPECT_EQ(textOf(source.get("a")), "1");
    EXPECT_EQ(textOf(source.get("b")), "two words");
    EXPECT_THAT(source.keys(), ElementsAre("a", "b"));
    EXPECT_EQ(source.path(), path);
    EXPECT_TRUE(source.status().loaded);
    EXPECT_FALSE(source.status().problem);
}

TEST_F(ReloadingFileSourceTest, IsWellWhileItsFileCanBeRead) {
    FileFolder::write(path, "a = 1\n");

    const ReloadingFileSource source(path);

    EXPECT_TRUE(source.state().isWell);
    EXPECT_EQ(source.state().updated, source.status().loaded);
    EXPECT_EQ(source.state().lastError, "");
}

TEST_F(ReloadingFileSourceTest, TellsItsProblemAsAnySourceDoes) {
    const ReloadingFileSource source(path, mayBeUnreadable());

    EXPECT_FALSE(source.state().isWell);
    EXPECT_EQ(source.state().since, source.status().problem->since);
    EXPECT_EQ(source.state().lastError, problemOf(source));
    EXPECT_EQ(source.state().updated, std::nullopt);
}

TEST_F(ReloadingFileSourceTest, RefusesToBeWritten) {
    FileFolder::write(path, "a=1\n");
    ReloadingFileSource source(path);

    EXPECT_EQ(thrownText<std::runtime_error>([&] { source.set("a", std::string("2")); }),
              "ReloadingFileSource does not support writing");
}

TEST_F(ReloadingFileSourceTest, RefusesAFileThatIsNotThere) {
    EXPECT_EQ(refusal(path), "Property file could not be opened: " + path.string());
}

TEST_F(ReloadingFileSourceTest, RefusesAFolder) {
    fs::create_directories(path);

    EXPECT_EQ(refusal(path), "Property file could not be opened: " + path.string());
}

TEST_F(ReloadingFileSourceTest, RefusesAFileThatIsTooLarge) {
    FileFolder::write(path, "key=1\n");
    ReloadingFileOptions options;
    options.mostBytes = 5;

    EXPECT_EQ(refusal(path, options), "Property file is larger than 5 bytes: " + path.string());
}

TEST_F(ReloadingFileSourceTest, RefusesToLookAllTheTime) {
    FileFolder::write(path, "key=1\n");
    ReloadingFileOptions options;
    options.lookEvery = std::chrono::milliseconds(0);

    EXPECT_EQ(thrownText<std::invalid_argument>([&] { ReloadingFileSource(path, options); }),
              "A file has to be looked at in intervals.");
}

TEST_F(ReloadingFileSourceTest, TakesARelativePathForWhereItLeadsAtFirst) {
    FileFolder::write(path, "key=1\n");
    const auto elsewhere = fs::current_path();
    fs::current_path(path.parent_path());
    const auto source = following.follow("file");
    fs::current_path(elsewhere);

    FileFolder::replace(path, "key=2\n");

    EXPECT_TRUE(following.isTold("key=2"));
    EXPECT_TRUE(source->path().is_absolute());
}

TEST_F(ReloadingFileSourceTest, MayBeginWithoutAFile) {
    const LogCapture log("velkor::files");

    const auto source = following.follow(path, mayBeUnreadable());

    const auto text =
        "Property file could not be opened: " + path.string() + ": No such file or directory";
    EXPECT_THAT(source->keys(), IsEmpty());
    EXPECT_FALSE(source->status().loaded);
    EXPECT_EQ(problemOf(*source), text);
    EXPECT_THAT(log.messages(), ElementsAre(text));
}

TEST_F(ReloadingFileSourceTest, FollowsAFileThatChangedBeforeItWasRegistered) {
    FileFolder::write(path, "key=1\n");
    const auto source = std::make_shared<ReloadingFileSource>(path);
    FileFolder::replace(path, "key=2\n");

    following.store->addSource("file", "", 5, true, source).get();

    EXPECT_TRUE(following.isTold("key=2"));
}

TEST_F(ReloadingFileSourceTest, TellsExactlyTheKeysThatHaveOtherValues) {
    FileFolder::write(path, "same=1\nother=1\ngone=1\n");
    following.follow(path);

    FileFolder::replace(path, "new=3\nother=2\nsame=1\n");
    ASSERT_TRUE(following.isTold("gone"));

    following.passFence();
    EXPECT_THAT(following.told(), UnorderedElementsAre("other=2", "new=3", "gone"));
}

TEST_F(ReloadingFileSourceTest, TellsOfAllKeysTogether) {
    FileFolder::write(path, "a=1\nb=1\n");
    following.follow(path);
    std::vector<std::string> seen;
    testing::Latch toldOfBoth(2);
    const auto note = [&](const ConfigurationValue& value) {
        if (textOf(value) != "2") return;
        seen.push_back(following.valueOf("a") + following.valueOf("b"));
        toldOfBoth.countDown();
    };
    const auto a = reactive_streams::subscribe(*following.store->watchOption("a"), {note, {}, {}});
    const auto b = reactive_streams::subscribe(*following.store->watchOption("b"), {note, {}, {}});

    FileFolder::replace(path, "a=2\nb=2\n");

    ASSERT_TRUE(toldOfBoth.wait());
    EXPECT_THAT(seen, ElementsAre("22", "22"));
}

TEST_F(ReloadingFileSourceTest, LeavesTheValuesOfOtherKeysWhereTheyAre) {
    const std::string text(100, 'x');
    FileFolder::write(path, "key=1\nsame=" + text + "\n");
    const auto source = following.follow(path);
    const auto place = [&] {
        return boost::get<std::string>(*source->table()->find("same")).data();
    };
    const char* const before = place();

    FileFolder::replace(path, "same=" + text + "\nkey=2\n");

    ASSERT_TRUE(following.isTold("key=2"));
    EXPECT_EQ(place(), before);
}

TEST_F(ReloadingFileSourceTest, LetsALowerLayerShowWhenAKeyGoes) {
    following.store->set("key", std::string("default"), "default").get();
    FileFolder::write(path, "key=1\n");
    following.follow(path);

    FileFolder::replace(path, "other=1\n");

    EXPECT_TRUE(following.isTold("key=default"));
}

TEST_F(ReloadingFileSourceTest, SaysNothingOfAFileWithOtherTextAndTheSameValues) {
    FileFolder::write(path, "key=1\n");
    const auto source = following.follow(path);
    const auto loaded = source->status().loaded;

    FileFolder::replace(path, "# a comment\nkey = 1\n");
    following.passFence();

    EXPECT_THAT(following.told(), IsEmpty());
    EXPECT_GT(source->status().loaded, loaded);
}

TEST_F(ReloadingFileSourceTest, TellsOfABurstByFewReloads) {
    constexpr int writes = 200;
    FileFolder::write(path, "key=0\n");
    following.follow(path);

    for (int i = 1; i <= writes; ++i) {
        FileFolder::replace(path, "key=" + std::to_string(i) + "\n");
    }

    ASSERT_TRUE(following.isTold("key=" + std::to_string(writes)));
    EXPECT_LT(following.told().size(), writes / 2U);
}

TEST_F(ReloadingFileSourceTest, WaitsForASlowWriterToClose) {
    FileFolder::write(path, "a=1\nb=1\n");
    following.follow(path);
    {
        const OpenFile file(path, O_TRUNC);
        following.passFence();
        file.write("a=2\n");
        following.passFence();
        file.write("b=2\n");
        EXPECT_THAT(following.told(), Not(Contains("a=2")));
    }

    EXPECT_TRUE(following.isTold("b=2"));
    EXPECT_THAT(following.told(), Not(Contains("b")));
}

TEST_F(ReloadingFileSourceTest, WaitsForASlowWriterOfANewFileToClose) {
    FileFolder::write(path, "a=1\nb=1\n");
    const auto source = following.follow(path);
    fs::remove(path);
    {
        const OpenFile file(path, O_CREAT);
        file.write("a=2\n");
        // For longer than anything is put off.
        const auto end = std::chrono::steady_clock::now() + std::chrono::milliseconds(1200);
        while (std::chrono::steady_clock::now() < end) following.passFence();
        file.write("b=2\n");
        EXPECT_THAT(following.told(), Not(Contains("a=2")));
    }

    EXPECT_TRUE(following.isTold("b=2"));
    EXPECT_THAT(following.told(), Not(Contains("b")));
}

TEST_F(ReloadingFileSourceTest, FollowsAFileInAFolderThatIsMadeStepByStep) {
    following.follow(folder / "a" / "b" / "file", mayBeUnreadable());

    fs::create_directory(folder / "a");
    following.passFence();
    fs::create_directory(folder / "a" / "b");
    following.passFence();
    FileFolder::write(folder / "a" / "b" / "file", "key=1\n");

    EXPECT_TRUE(following.isTold("key=1"));
}

TEST_F(ReloadingFileSourceTest, FollowsNothingOnceItIsRemoved) {
    FileFolder::write(path, "key=1\n");
    const auto source = following.follow(path);

    following.store->removeSource("file").get();
    FileFolder::replace(path, "key=2\n");
    following.passFence();

    EXPECT_EQ(textOf(source->get("key")), "1");
}

TEST_F(ReloadingFileSourceTest, FollowsTheFileAgainWhenItIsRegisteredAgain) {
    FileFolder::write(path, "key=1\n");
    const auto source = following.follow(path);
    following.store->removeSource("file").get();
    FileFolder::replace(path, "key=2\n");

    following.store->addSource("file", "", 5, true, source).get();
    ASSERT_TRUE(following.isTold("key=2"));

    FileFolder::replace(path, "key=3\n");
    EXPECT_TRUE(following.isTold("key=3"));
}

TEST_F(ReloadingFileSourceTest, OutlivesItsStore) {
    FileFolder::write(path, "key=1\n");
    auto store = std::make_shared<configuration::ConfigurationImpl>();
    const auto source = std::make_shared<ReloadingFileSource>(path);
    store->addSource("file", "", 5, true, source).get();

    store.reset();
    FileFolder::replace(path, "key=2\n");
    following.passFence();

    EXPECT_EQ(textOf(source->get("key")), "1");
}

// What makes a file unreadable, and what is said of it.
struct Loss {
    const char* name;
    std::function<void(const fs::path&)> lose;
    std::string problem;  // PATH stands for the path
};

const std::vector<Loss> losses{
    {"Removed", [](const fs::path& path) { fs::remove(path); },
     "Property file could not be opened: PATH: No such file or directory"},
    {"Emptied", [](const fs::path& path) { FileFolder::write(path, ""); },
     "Property file is empty: PATH"},
    {"TooLarge",
     [](const fs::path& path) { FileFolder::replace(path, std::string(101, 'x') + "=1\n"); },
     "Property file is larger than 100 bytes: PATH"},
    {"ReplacedByAFolder",
     [](const fs::path& path) {
         fs::remove(path);
         fs::create_directory(path);
     },
     "Property file could not be opened: PATH: Is a directory"},
    {"ReplacedByAPipe",
     [](const fs::path& path) {
         fs::remove(path);
         ::mkfifo(path.c_str(), 0600);
     },
     "Property file could not be opened: PATH: Not a regular file"},
    {"LinkedToNothing", [](const fs::path& path) { FileFolder::relink(path, "nothing"); },
     "Property file could not be opened: PATH: No such file or directory"},
    {"LinkedToItself", [](const fs::path& path) { FileFolder::relink(path, path); },
     "Property file could not be opened: PATH: Too many levels of symbolic links"},
};

class UnreadableFile : public ReloadingFileSourceTest, public ::testing::WithParamInterface<Loss> {
protected:
    UnreadableFile() {
        FileFolder::write(path, "key=1\n");
        options.mostBytes = 100;
        // So that only what the system tells of counts.
        options.lookEvery = std::chrono::hours(1);
    }

    void lose() {
        GetParam().lose(path);
        following.passFence();
    }

    void recover() {
        fs::remove(path);
        FileFolder::replace(path, "key=2\n");
    }

    std::string problem() const {
        auto text = GetParam().problem;
        return text.replace(text.find("PATH"), 4, path.string());
    }

    ReloadingFileOptions options;
};

TEST_P(UnreadableFile, KeepsItsValuesAndSaysWhatIsWrong) {
    const auto source = following.follow(path, options);
    const auto loaded = source->status().loaded;

    lose();

    EXPECT_EQ(following.valueOf("key"), "1");
    EXPECT_EQ(problemOf(*source), problem());
    EXPECT_EQ(source->status().loaded, loaded);
    EXPECT_GE(source->status().problem->since, loaded);
}

TEST_P(UnreadableFile, LosesItsValuesIfThatIsWanted) {
    options.forgetsUnreadable = true;
    const auto source = following.follow(path, options);

    lose();

    EXPECT_TRUE(following.isTold("key"));
    EXPECT_THAT(source->keys(), IsEmpty());
    EXPECT_EQ(problemOf(*source), problem());
}

TEST_P(UnreadableFile, IsReadAgainWhenItIsBack) {
    for (const bool forgets : {false, true}) {
        options.forgetsUnreadable = forgets;
        FileFolder::replace(path, "key=1\n");
        const auto source = following.follow(path, options);
        lose();

        recover();

        EXPECT_TRUE(following.isTold("key=2"));
        EXPECT_FALSE(source->status().problem);
        following.store->removeSource("file").get();
        fs::remove_all(path);
    }
}

TEST_P(UnreadableFile, IsLoggedOnce) {
    const LogCapture log("velkor::files", common::warning);
    const auto source = following.follow(path, options);

    lose();
    lose();
    EXPECT_THAT(log.messages(), ElementsAre(problem()));

    recover();
    ASSERT_TRUE(following.isTold("key=2"));
    EXPECT_THAT(log.messages(),
                ElementsAre(problem(), "Property file is read again: " + path.string()));
}

INSTANTIATE_TEST_SUITE_P(Losses, UnreadableFile, ::testing::ValuesIn(losses),
                         [](const auto& loss) { return loss.param.name; });

[[noreturn]] void endWhileToldOfAFile() {
    static FileFolder folder;
    FileFolder::write(folder / "file", "a=1\n");
    velkor::testing::endWhileTold(
        std::make_shared<ReloadingFileSource>(folder / "file"),
        [](ReloadingFileSource&) { FileFolder::replace(folder / "file", "a=2\n"); });
}

TEST_F(ReloadingFileSourceTest, IsWaitedForByTheEndOfTheProcessWhileItTells) {
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(endWhileToldOfAFile(), ::testing::ExitedWithCode(0), "waited for");
}

TEST_F(ReloadingFileSourceTest, NoticesWhetherItMayReadTheFile) {
    FileFolder::write(path, "key=1\n");
    const auto source = following.follow(path);
    {
        const Refusal forbidden(SystemHooks::accessRefused, EACCES);
        ::chmod(path.c_str(), 0);
        // Nothing else can be read meanwhile either, so no fence.
        EXPECT_TRUE(comesAbout([&] { return !problemOf(*source).empty(); }));
        EXPECT_EQ(problemOf(*source),
                  "Property file could not be opened: " + path.string() + ": Permission denied");
    }

    ::chmod(path.c_str(), 0600);
    following.passFence();

    EXPECT_FALSE(source->status().problem);
}

TEST_F(ReloadingFileSourceTest, SaysSinceWhenSomethingIsWrong) {
    FileFolder::write(path, "key=1\n");
    const auto source = following.follow(path);
    fs::remove(path);
    following.passFence();
    const auto since = source->status().problem->since;

    fs::create_directory(path);
    following.passFence();

    EXPECT_THAT(problemOf(*source), ::testing::EndsWith("Is a directory"));
    EXPECT_EQ(source->status().problem->since, since);
}

TEST_F(ReloadingFileSourceTest, TakesAFileThatWasEmptyAtFirstForWhatItIs) {
    FileFolder::write(path, "");
    const auto source = following.follow(path);
    FileFolder::replace(path, "");
    following.passFence();

    EXPECT_FALSE(source->status().problem);
}

TEST_F(ReloadingFileSourceTest, TakesAFileWithoutKeysForWhatItIs) {
    FileFolder::write(path, "key=1\n");
    const auto source = following.follow(path);

    FileFolder::replace(path, "# nothing is set\n");

    EXPECT_TRUE(following.isTold("key"));
    EXPECT_FALSE(source->status().problem);
}

}  // namespace
}  // namespace velkor::layers
