#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "tests/host/ChildProcess.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::host {
namespace {

using velkor::testing::TemporaryFile;

// Sets a value of each type but that of property files.
const std::string everyType =
    "set a.bool true\nset a.int -5\nset a.double 0.25\n"
    R"(send ConfigurationSet {"key":"a.uint","value":{"type":"uint","value":4000000000}})"
    "\n"
    R"(send ConfigurationSet {"key":"a.ustring","value":{"type":"ustring","value":"\u20ac \u0001"}})"
    "\n"
    R"(send ConfigurationSet {"key":"a.bools","value":{"type":"boolArray","value":[true,false]}})"
    "\n"
    R"(send ConfigurationSet {"key":"a.ints","value":{"type":"intArray","value":[1,-2]}})"
    "\n"
    R"(send ConfigurationSet {"key":"a.uints","value":{"type":"uintArray","value":[]}})"
    "\n"
    R"(send ConfigurationSet {"key":"a.doubles","value":{"type":"doubleArray","value":[0.1,-0.0,1e300]}})"
    "\n"
    R"(send ConfigurationSet {"key":"a.strings","value":{"type":"stringArray","value":["a","b, c"]}})"
    "\n"
    R"(send ConfigurationSet {"key":"a.ustrings","value":{"type":"ustringArray","value":["\u20ac"]}})"
    "\n"
    "set a.string 'some text'\n";

std::string lastLines(const std::string& text, const std::string& from) {
    return text.substr(text.find(from));
}

// Every byte, in keys and in values, at their beginnings, in their middle and at their ends.
std::string everyByte() {
    constexpr const char* digits = "0123456789abcdef";
    std::string text;
    for (int byte = 0; byte < 256; ++byte) {
        const char code = static_cast<char>(byte);
        const std::string escaped =
            code == '\n' || code == '\r' || code == 'u'
                ? std::string("\\u00") + digits[byte / 16] + digits[byte % 16]
                : std::string("\\") + code;
        const std::string name = std::to_string(byte);
        text += escaped + "key" + name + " = " + escaped + "value\n";
        text += "key" + name + escaped + "x = a" + escaped + escaped + "z\n";
        text += "kex" + name + escaped + " = value" + escaped + '\n';
    }
    return text + "= = the value of the empty key\n";
}

TEST(Export, OfAPropertyFileReadsTheSameWhateverBytesItHolds) {
    const TemporaryFile file(everyByte());
    const std::string path = file.path().string();
    const auto exported = runProgram({path, "-c", "export --format properties"});
    ASSERT_EQ(exported.exitCode, 0);
    const TemporaryFile again(exported.out);
    const std::string allBytes = runProgram({path, "-c", "list"}).out;
    EXPECT_GT(allBytes.size(), 3U * 256 * 10);
    EXPECT_EQ(runProgram({again.path().string(), "-c", "list"}).out, allBytes);
    EXPECT_EQ(runProgram({"-c", "import " + again.path().string(), "-c", "list"}).out, allBytes);
}

TEST(Export, OfAPropertyFileHasNoFlawsButBytesThatAreNoUtf8) {
    const TemporaryFile file(everyByte());
    const auto exported = runProgram({file.path().string(), "-c", "export"});
    const TemporaryFile again(exported.out);
    const auto checked = runProgram({"--check", again.path().string()});
    std::size_t remarks = 0;
    for (const char byte : checked.out) remarks += byte == '\n' ? 1 : 0;
    std::size_t foreign = 0;
    for (auto at = checked.out.find("not UTF-8"); at != std::string::npos; ++foreign) {
        at = checked.out.find("not UTF-8", at + 1);
    }
    EXPECT_EQ(remarks, foreign);
    EXPECT_EQ(foreign, 3U * 128);
}

TEST(Export, IsThatOfLayersAsTheyAreEffective) {
    const TemporaryFile low("a=1\nb=1\n", "low.properties");
    const TemporaryFile high("a=2\nc =  x\n", "high.properties");
    const std::vector<std::string> both{low.path().string(), high.path().string(), "-c"};
    const auto run = [&](const std::string& command) {
        auto arguments = both;
        arguments.push_back(command);
        return runProgram(arguments).out;
    };
    const std::string exported = run("export --format properties");
    EXPECT_EQ(exported, "a = 2\nb = 1\nc = \\ x\n");
    const TemporaryFile again(exported);
    EXPECT_EQ(runProgram({again.path().string(), "-c", "show --json"}).out, run("show --json"));
    EXPECT_EQ(run("export b"), "b = 1\n");
    EXPECT_EQ(run("export --format json ?"), run("show --json"));
}

TEST(Export, OfTwoFilesTakesTheirPlace) {
    const TemporaryFile a("host = a.example\nport = 80\nname = \\u20AC\n", "a.properties");
    const TemporaryFile b("port = 8080\nuser = me\n", "b.properties");
    const std::string first = a.path().string();
    const std::string second = b.path().string();
    EXPECT_EQ(runProgram({first, second, "-c", "diff b"}).out,
              "~ port = '80' -> '8080'\n+ user = 'me'\n");
    const TemporaryFile c(runProgram({first, second, "-c", "export --format properties"}).out, "c");
    const auto before = runProgram({first, second, "-c", "show --json"});
    const auto after = runProgram({c.path().string(), "-c", "show --json"});
    EXPECT_EQ(before.out.rfind("{\n\"host\":", 0), 0U);
    EXPECT_EQ(after.out, before.out);
    EXPECT_EQ(after.err + before.err, "");
}

TEST(Export, ToJsonKeepsEveryType) {
    const auto first = runProgram({}, everyType + "export --format json\n");
    const std::string exported = lastLines(first.out, "{\n");
    EXPECT_EQ(first.err, "");
    const TemporaryFile file(exported);
    const auto second = runProgram(
        {"-c", "import " + file.path().string(), "-c", "show --json", "-c", "get a.doubles"});
    EXPECT_EQ(second.out, exported + "[0.1, -0, 1e+300]\n");
    EXPECT_EQ(second.exitCode, 0);
}

TEST(Export, ToAPropertyFileSaysThatTypesAreLost) {
    const auto result = runProgram({}, everyType + "export\n");
    EXPECT_EQ(lastLines(result.out, "a.bool ="),
              "a.bool = true\na.bools = true, false\na.double = 0.25\na.doubles = 0.1, -0, 1e+300\n"
              "a.int = -5\na.ints = 1, -2\na.string = some text\na.strings = a, \"b, c\"\n"
              "a.uint = 4000000000\na.uints = \na.ustring = € \\u0001\na.ustrings = €\n");
    EXPECT_EQ(result.err,
              "velkor-config: 11 values become text in a property file; --format json keeps every "
              "type.\n");
    EXPECT_EQ(result.exitCode, 0);
    EXPECT_EQ(runProgram({"-c", "set a 1", "-c", "export a"}).err,
              "velkor-config: 1 value becomes text in a property file; --format json keeps every "
              "type.\n");
}

TEST(Export, ToJsonRefusesWhatJsonCantHold) {
    const TemporaryFile key("caf\xE9=1\n");
    const TemporaryFile value("a=caf\xE9\n");
    const auto result = runProgram({key.path().string(), "-c", "export --format json"});
    EXPECT_NE(result.err.find("JSON can't hold caf\\xe9: it is no UTF-8, or no finite number\n"),
              std::string::npos);
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_EQ(runProgram({value.path().string(), "-c", "export --format json"}).exitCode, 1);
}

TEST(Export, RefusesOtherFormats) {
    const auto result = runProgram({"-c", "export --format xml"});
    EXPECT_EQ(result.err, "velkor-config: --format xml: properties or json is needed\n");
    EXPECT_EQ(runProgram({"-c", "export --format"}).err,
              "velkor-config: export: --format needs properties|json.\n");
}

TEST(Export, SaysWhichPatternsMatchNothing) {
    const auto result = runProgram({"-c", "export a*"});
    EXPECT_EQ(result.err, "velkor-config: No key matches: a*\n");
    EXPECT_EQ(result.exitCode, 1);
}

struct RefusedImport {
    const char* name;
    std::string content;
    std::string message;  ///< Behind the path.

    friend std::ostream& operator<<(std::ostream& out, const RefusedImport& it) {
        return out << it.name;
    }
};

class Import : public ::testing::TestWithParam<RefusedImport> {};

TEST_P(Import, IsRefusedAsAWhole) {
    const TemporaryFile file(GetParam().content);
    const auto result = runProgram({"-c", "import " + file.path().string(), "-c", "list"});
    EXPECT_EQ(result.out, "");
    EXPECT_EQ(
        result.err.rfind("velkor-config: " + file.path().string() + ": " + GetParam().message, 0),
        0U)
        << result.err;
    EXPECT_EQ(result.exitCode, 1);
}

INSTANTIATE_TEST_SUITE_P(
    Refused, Import,
    ::testing::Values(
        RefusedImport{"NoJson", "{\"a\":", "Invalid JSON text: "},
        RefusedImport{"NoValue", R"({"a":{"type":"int","value":1},"b":5})",
                      "b is no object of a type and a value of that type\n"},
        RefusedImport{"UnknownType", R"({"b":{"type":"integer","value":1}})", "b is no object"},
        RefusedImport{"AnotherType", R"({"b":{"type":"int","value":"x"}})", "b is no object"},
        RefusedImport{"OutOfRange", R"({"b":{"type":"int","value":5000000000}})", "b is no object"},
        RefusedImport{"NoNumber", R"({"b":{"type":"double","value":null}})", "b is no object"},
        RefusedImport{"MixedArray", R"({"b":{"type":"intArray","value":[1,true]}})",
                      "b is no object"},
        RefusedImport{"MoreThanAValue", R"({"b":{"type":"int","value":1,"source":"x"}})",
                      "b is no object"}),
    [](const auto& tested) { return std::string(tested.param.name); });

TEST(ImportFile, ThatTheStoreRefusesChangesNothing) {
    const TemporaryFile file("server.port = 1\na = 2\n");
    const auto result =
        runProgram({"--source", "s=" VELKOR_EXAMPLES "/service.properties,order=-1,writable", "-c",
                    "import " + file.path().string(), "-c", "show a", "-c", "get server.port"});
    EXPECT_EQ(result.out, "'8080'\n");
    EXPECT_NE(result.err.find("writing"), std::string::npos);
    EXPECT_NE(result.err.find("No configuration option with key: a\n"), std::string::npos);
    EXPECT_EQ(result.exitCode, 1);
}

TEST(ImportFile, GoesIntoTheLayerThatTakesWrites) {
    const TemporaryFile file("a = 1 \n");
    const auto result = runProgram({"-c", "import " + file.path().string(), "-c", "show --source"});
    EXPECT_EQ(result.out, "a = '1 ' (override)\n");
    EXPECT_EQ(result.err, "velkor-config: " + file.path().string() + ": 1 remark, see check\n");
}

TEST(ImportFile, CanBeTakenForAnotherFormat) {
    const TemporaryFile file("{a} = 1\n");
    EXPECT_EQ(
        runProgram({"-c", "import --format properties " + file.path().string(), "-c", "list"}).out,
        "{a} = '1'\n");
}

TEST(ImportFile, HasToBeThere) {
    const auto result = runProgram({"-c", "import /no/file"});
    EXPECT_NE(result.err.find("Property file could not be opened: /no/file: No such file"),
              std::string::npos);
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_EQ(runProgram({"-c", "import a b"}).err,
              "velkor-config: import takes FILE [--format properties|json]\n");
}

}  // namespace
}  // namespace velkor::host
