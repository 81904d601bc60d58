#include "host/console/SourceCommands.hpp"

#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "host/SessionStore.hpp"
#include "host/console/Command.hpp"
#include "host/console/ValueText.hpp"
#include "tests/support/TemporaryFile.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::host {
namespace {

using velkor::testing::thrownText;
using Words = std::vector<std::string>;

class SourceCommandsTest : public ::testing::Test {
protected:
    std::string load(Words arguments) { return loadFile(sources, arguments); }
    std::string unload(const std::string& name) { return unloadSource(sources, {name}); }

    std::string refusedLoad(const Words& arguments) {
        return thrownText<CommandError>([&] { load(arguments); });
    }
    std::string refusedUnload(const std::string& name) {
        return thrownText<CommandError>([&] { unload(name); });
    }

    const velkor::testing::TemporaryFile file{"port=80\n"};
    const std::string path = file.path().string();
    std::shared_ptr<SessionStore> store = std::make_shared<SessionStore>(SourceLimits{1000});
    SessionSources sources{store, SourceLimits{1000}};
};

TEST_F(SourceCommandsTest, LoadGivesTheSourceTheNameOfItsFile) {
    EXPECT_EQ(load({path}), "Loaded as file.");
    EXPECT_EQ(load({path}), "Loaded as file-2.");
    EXPECT_EQ(sources.names(), (Words{"override", "file-2", "file", "default"}));
}

TEST_F(SourceCommandsTest, LoadTakesAllThatASourceHas) {
    EXPECT_EQ(load({path, "--name", "site", "--group", "server", "--order", "-5", "--writable"}),
              "Loaded as site.");
    const auto source = store->describeSources().get().at(0);
    EXPECT_EQ(source.name, "site");
    EXPECT_EQ(source.group, "server.");
    EXPECT_EQ(source.order, -5);
    EXPECT_FALSE(source.readOnly);
    EXPECT_EQ(valueText(store->get("server.port").get()), "'80'");
}

TEST_F(SourceCommandsTest, AFileThatCantBeReadIsRefusedAlsoWhereFilesAreWatched) {
    for (const bool watches : {false, true}) {
        sources.watchFiles(watches);
        EXPECT_EQ(refusedLoad({"/no/file"}),
                  "Property file could not be opened: /no/file: No such file or directory");
    }
    EXPECT_EQ(sources.names(), (Words{"override", "default"}));
}

TEST_F(SourceCommandsTest, RemarksOnALoadedFileAreNoticed) {
    Words notices;
    SessionSources noticing(store, SourceLimits{1000},
                            [&](const auto& text) { notices.push_back(text); });
    file.rewrite("port=80 \n");
    loadFile(noticing, {path});
    EXPECT_EQ(notices, Words{path + ": 1 remark, see check"});
}

TEST_F(SourceCommandsTest, AFileThatIsTooLargeIsRefused) {
    file.rewrite(std::string(1001, '#'));
    EXPECT_EQ(refusedLoad({path}), "Property file is larger than 1000 bytes: " + path);
}

TEST_F(SourceCommandsTest, ANameThatIsTakenIsRefused) {
    EXPECT_EQ(refusedLoad({path, "--name", "override"}),
              "Source with the requested name already exists: override");
}

TEST_F(SourceCommandsTest, AnOrderThatIsNoNumberIsRefused) {
    EXPECT_EQ(refusedLoad({path, "--order", "2147483648"}),
              "--order 2147483648: a number of 32 bits is needed");
}

TEST_F(SourceCommandsTest, UnloadRemovesASource) {
    sources.watchFiles(true);
    load({path});
    EXPECT_EQ(unload("file"), "");
    EXPECT_FALSE(store->has("port").get());
    EXPECT_EQ(load({path}), "Loaded as file.");
}

TEST_F(SourceCommandsTest, UnloadRefusesASourceThatIsNotThere) {
    load({path, "--name", "site"});
    EXPECT_EQ(refusedUnload("siet"), "Unknown source: siet (did you mean: site?)");
    EXPECT_EQ(refusedUnload("state"), "Unknown source: state (did you mean: site?)");
}

TEST_F(SourceCommandsTest, UnloadRefusesWhatTheSessionNeeds) {
    EXPECT_EQ(refusedUnload("override"), "The session needs its source: override");
    EXPECT_EQ(refusedUnload("default"), "The session needs its source: default");
}

}  // namespace
}  // namespace velkor::host
