#include "layers/sqlite/detail/Schema.hpp"

#include <gtest/gtest.h>

#include <stdexcept>
#include <string>
#include <vector>

#include "layers/sqlite/detail/Connection.hpp"
#include "tests/layers/sqlite/StateTesting.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::layers::detail {
namespace {

using velkor::testing::StateFolder;
using velkor::testing::thrownText;

const std::vector<std::string> oneStep{"CREATE TABLE entries (key, value)"};
const std::vector<std::string> threeSteps{oneStep[0], "ALTER TABLE entries ADD COLUMN note",
                                          "UPDATE entries SET note = 'old'"};

TEST(Schema, OfANewFileIsTheNewest) {
    const StateFolder folder;
    Connection connection(folder.file(), "");
    bringUpToDate(connection, threeSteps);
    EXPECT_EQ(connection.number("PRAGMA user_version"), 3);
    EXPECT_EQ(connection.text("PRAGMA journal_mode"), "wal");
}

TEST(Schema, OfAnOlderFileIsBroughtUpToDateWithItsContent) {
    const StateFolder folder;
    {
        Connection connection(folder.file(), "");
        bringUpToDate(connection, oneStep);
        connection.execute("INSERT INTO entries VALUES ('a', 1)");
    }
    Connection connection(folder.file(), "");
    bringUpToDate(connection, threeSteps);
    EXPECT_EQ(connection.number("PRAGMA user_version"), 3);
    EXPECT_EQ(connection.text("SELECT CAST(key || value || note AS BLOB) FROM entries"), "a1old");
}

TEST(Schema, ThatIsTheNewestStays) {
    const StateFolder folder;
    Connection connection(folder.file(), "");
    bringUpToDate(connection, threeSteps);
    EXPECT_NO_THROW(bringUpToDate(connection, threeSteps));
}

TEST(Schema, StaysWhereAStepFails) {
    const StateFolder folder;
    Connection connection(folder.file(), "");
    bringUpToDate(connection, oneStep);
    EXPECT_THROW(
        bringUpToDate(connection, {oneStep[0], "ALTER TABLE entries ADD COLUMN note", "nonsense"}),
        std::runtime_error);
    EXPECT_EQ(connection.number("PRAGMA user_version"), 1);
    EXPECT_EQ(connection.number("SELECT count(*) FROM pragma_table_info('entries')"), 2);
}

TEST(Schema, ThatIsNewerIsRefused) {
    const StateFolder folder;
    Connection connection(folder.file(), "");
    bringUpToDate(connection, threeSteps);
    EXPECT_EQ(thrownText<std::runtime_error>([&] { bringUpToDate(connection, oneStep); }),
              "its schema 3 is newer than 1, the newest that is known here");
}

TEST(Connection, SyncsEachCommit) {
    const StateFolder folder;
    Connection connection(folder.file(), "");
    bringUpToDate(connection);
    constexpr int full = 2;
    EXPECT_EQ(connection.number("PRAGMA synchronous"), full);
}

}  // namespace
}  // namespace velkor::layers::detail
