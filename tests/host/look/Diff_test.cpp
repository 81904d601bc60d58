#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "tests/host/ChildProcess.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::host {
namespace {

using velkor::testing::TemporaryFile;

class Diff : public ::testing::Test {
protected:
    ChildResult run(const std::string& command) const {
        return runProgram(
            {low.path().string(), middle.path().string(), high.path().string(), "-c", command});
    }

    const TemporaryFile low{"a=1\nb=1\nc=1\n", "low.properties"};
    const TemporaryFile middle{"a=2\nb=1\nd=2\n", "middle.properties"};
    const TemporaryFile high{"a=1\nd=3\ne=3\n", "high.properties"};
};

TEST_F(Diff, ShowsWhatALayerChangesOfAllBehindIt) {
    EXPECT_EQ(run("diff high").out, "~ a = '2' -> '1'\n~ d = '2' -> '3'\n+ e = '3'\n");
    EXPECT_EQ(run("diff middle").out, "~ a = '1' -> '2'\n+ d = '2'\n");
    EXPECT_EQ(run("diff override").out, "");
}

TEST_F(Diff, ShowsWhatALayerChangesOfAnother) {
    EXPECT_EQ(run("diff low high").out, "+ d = '3'\n+ e = '3'\n");
    EXPECT_EQ(run("diff high low").out, "+ b = '1'\n+ c = '1'\n");
}

TEST_F(Diff, ShowsWhatEachLayerChanges) {
    EXPECT_EQ(run("diff").out,
              "~ a = '2' -> '1' (high)\n~ a = '1' -> '2' (middle)\n+ a = '1' (low)\n"
              "+ b = '1' (low)\n+ c = '1' (low)\n"
              "~ d = '2' -> '3' (high)\n+ d = '2' (middle)\n+ e = '3' (high)\n");
}

TEST_F(Diff, SeesAnotherType) {
    const auto result = runProgram({low.path().string(), "-c", "set a 1", "-c", "diff override"});
    EXPECT_EQ(result.out, "~ a = '1' -> 1\n");
    EXPECT_EQ(result.exitCode, 0);
}

TEST_F(Diff, RefusesALayerThatIsNotThere) {
    const auto result = run("diff low hihg");
    EXPECT_EQ(result.err, "velkor-config: No source is called: hihg\n");
    EXPECT_EQ(result.exitCode, 1);
}

}  // namespace
}  // namespace velkor::host
