#include <gtest/gtest.h>

#include <string>

#include "tests/host/ChildProcess.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::host {
namespace {

using velkor::testing::TemporaryFile;

TEST(JsonAnswers, OfSources) {
    const TemporaryFile file("a=1\n");
    EXPECT_EQ(runProgram({"--source", "s=" + file.path().string() + ",group=g,order=7", "-c",
                          "sources --json"})
                  .out,
              R"({"sources":[{"group":"","name":"override","order":0,"readOnly":false},)"
              R"({"group":"g.","name":"s","order":7,"readOnly":true},)"
              R"({"group":"","name":"default","order":2147483647,"readOnly":false}]})"
              "\n");
}

TEST(JsonAnswers, OfASourceWithAProblem) {
    const auto result = runProgram({"--watch-files", "/no/file", "-c", "sources --json"});
    EXPECT_NE(result.out.find(R"("problem":"since )"), std::string::npos);
    EXPECT_NE(result.out.find("Property file could not be opened: /no/file: No such file"),
              std::string::npos)
        << result.out;
}

TEST(JsonAnswers, OfTheLayersOfAKey) {
    const TemporaryFile file("a=1\n");
    const auto result = runProgram({"--source", "s=" + file.path().string(), "-c", "set a 2", "-c",
                                    "explain a --json", "-c", "explain --json b"});
    EXPECT_EQ(result.out,
              R"({"key":"a","layers":[{"source":"override","value":{"type":"int","value":2}},)"
              R"({"source":"s","value":{"type":"string","value":"1"}}]})"
              "\n"
              R"({"key":"b","layers":[]})"
              "\n");
    EXPECT_EQ(result.exitCode, 0);
}

TEST(JsonAnswers, OfWatchedValues) {
    const auto result =
        runProgram({}, "set a 1\nwatch a --json\nset a 0.5\nwatch --json a\nunwatch a\nset a 2\n");
    EXPECT_EQ(result.out, R"({"key":"a","value":{"type":"int","value":1}})"
                          "\n"
                          R"({"key":"a","value":{"type":"double","value":0.5}})"
                          "\n");
    EXPECT_EQ(result.err, "velkor-config: line 4: Watched already: a\n");
}

TEST(JsonAnswers, OfMessagesWithoutTheirTypes) {
    const auto result = runProgram({},
                                   "set a 1\nsend --raw  ConfigurationGet  {\"key\": \"a\"} \n"
                                   "send --raw ConfigurationKeys\nsend --raw\nsend --raw Nope\n");
    EXPECT_EQ(result.out, R"({"key":"a","source":"override","value":{"type":"int","value":1}})"
                          "\n"
                          R"({"keys":["a"]})"
                          "\n");
    EXPECT_EQ(result.err.rfind("velkor-config: line 4: send --raw takes TYPE [JSON].\n", 0), 0U);
    EXPECT_EQ(result.exitCode, 1);
}

TEST(JsonAnswers, AreOfNoOtherArguments) {
    EXPECT_EQ(runProgram({"-c", "sources x"}).err, "velkor-config: sources takes [--json]\n");
    EXPECT_EQ(runProgram({"-c", "explain a b"}).err, "velkor-config: explain takes KEY [--json]\n");
    EXPECT_EQ(runProgram({"-c", "explain --jsno"}).err,
              "velkor-config: explain knows no option --jsno; quote it where it is an ordinary "
              "word.\n");
}

}  // namespace
}  // namespace velkor::host
