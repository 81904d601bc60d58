#include "host/sources/PropertyFile.hpp"

#include <gtest/gtest.h>

#include <ostream>
#include <set>
#include <stdexcept>
#include <string>
#include <thread>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include "tests/support/TemporaryFile.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::host {
namespace {

using namespace std::string_literals;
using velkor::testing::TemporaryFile;
using velkor::testing::thrownText;
using Keys = std::set<std::string>;

// The text of the exact type that the library throws, too.
std::string loadingError(const std::string& path, std::uintmax_t mostBytes = 1000) {
    return thrownText<std::runtime_error>([&] { loadPropertyFile(path, {mostBytes}); });
}

TEST(PropertyFile, HoldsTheProperties) {
    const TemporaryFile file("a=1\nb=\\u20ac\n");
    const auto source = loadPropertyFile(file.path().string(), {});
    EXPECT_EQ(source->keys(), (Keys{"a", "b"}));
    EXPECT_EQ(boost::get<std::string>(source->get("b")), "\u20ac");
}

TEST(PropertyFile, MayBeLargerThanABlock) {
    const std::string value(1'000'000, 'x');
    const TemporaryFile file("a=" + value + "\n");
    EXPECT_EQ(boost::get<std::string>(loadPropertyFile(file.path().string(), {})->get("a")), value);
}

TEST(PropertyFile, MayBeAsLargeAsTheLimit) {
    const TemporaryFile file("a=12\n");
    EXPECT_EQ(loadPropertyFile(file.path().string(), {5})->keys(), Keys{"a"});
}

TEST(PropertyFile, IsRefusedWhenItIsLargerThanTheLimit) {
    const TemporaryFile file("a=12\n");
    const std::string path = file.path().string();
    EXPECT_EQ(loadingError(path, 4), "Property file is larger than 4 bytes: " + path);
}

TEST(PropertyFile, IsRefusedWhenItHasNoEnd) {
    EXPECT_EQ(loadingError("/dev/zero", 1'000'000),
              "Property file is larger than 1000000 bytes: /dev/zero");
}

TEST(PropertyFile, IsReadToItsEndWhenItIsAPipe) {
    const TemporaryFile place("");
    const std::string pipe = place.path().string() + ".pipe";
    ASSERT_EQ(::mkfifo(pipe.c_str(), 0600), 0);
    std::thread writer([&pipe] {
        const int end = ::open(pipe.c_str(), O_WRONLY | O_CLOEXEC);
        EXPECT_EQ(::write(end, "a=1\n", 4), 4);
        ::close(end);
    });
    const auto source = loadPropertyFile(pipe, {});
    writer.join();
    EXPECT_EQ(source->keys(), Keys{"a"});
}

struct UnreadableCase {
    const char* name;
    std::string path;
    std::string text;

    friend std::ostream& operator<<(std::ostream& out, const UnreadableCase& it) {
        return out << it.name;
    }
};

class UnreadablePropertyFile : public ::testing::TestWithParam<UnreadableCase> {};

TEST_P(UnreadablePropertyFile, IsRefusedWithTheReasonOfTheSystem) {
    EXPECT_EQ(loadingError(GetParam().path), GetParam().text);
}

INSTANTIATE_TEST_SUITE_P(
    Files, UnreadablePropertyFile,
    ::testing::Values(
        UnreadableCase{"Missing", "/no/\u00e9",
                       "Property file could not be opened: /no/\u00e9: No such file or directory"},
        UnreadableCase{"Nameless", "",
                       "Property file could not be opened: : No such file or directory"},
        UnreadableCase{"BelowAFile", "/dev/null/a",
                       "Property file could not be opened: /dev/null/a: Not a directory"},
        UnreadableCase{"Directory", "/tmp",
                       "Property file could not be opened: /tmp: Is a directory"},
        UnreadableCase{"NulInThePath", "/dev/null\0a"s,
                       "Property file could not be opened: /dev/null"},
        UnreadableCase{"TooLongAName", '/' + std::string(300, 'x'),
                       "Property file could not be opened: /" + std::string(300, 'x') +
                           ": File name too long"},
        UnreadableCase{"Broken", "/proc/self/mem",
                       "Property file could not be read: /proc/self/mem: Input/output error"}),
    [](const auto& tested) { return std::string(tested.param.name); });

}  // namespace
}  // namespace velkor::host
