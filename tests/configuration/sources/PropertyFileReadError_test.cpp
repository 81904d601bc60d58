#include <gtest/gtest.h>

#include <atomic>
#include <cerrno>
#include <cstdio>
#include <string>
#include <string_view>

#include "tests/configuration/sources/PropertyReading.hpp"

#include <sys/syscall.h>
#include <unistd.h>

namespace {

// While it is not negative: how many bytes of the marked file can still be read before the device
// fails.
std::atomic<long> readableBytes{-1};

constexpr std::string_view markedName = "/failing.properties";

bool isMarked(int descriptor) {
    char link[64];
    char target[4096];
    std::snprintf(link, sizeof link, "/proc/self/fd/%d", descriptor);
    const ssize_t length = ::readlink(link, target, sizeof target);
    if (length < 0) return false;
    const std::string_view path(target, static_cast<std::size_t>(length));
    return path.size() >= markedName.size() &&
           path.substr(path.size() - markedName.size()) == markedName;
}

}  // namespace

// Stands in for the system's function in this whole program, the C++ library's streams included.
extern "C" ssize_t read(int descriptor, void* buffer, std::size_t size) {
    if (readableBytes >= 0 && isMarked(descriptor)) {
        if (readableBytes == 0) {
            errno = EIO;
            return -1;
        }
        size = std::min(size, static_cast<std::size_t>(readableBytes.load()));
    }
    const ssize_t got = ::syscall(SYS_read, descriptor, buffer, size);
    if (readableBytes > 0 && got > 0 && isMarked(descriptor)) readableBytes -= got;
    return got;
}

namespace velkor::configuration {
namespace {

using testing::Properties;

class PropertyFileReadError : public ::testing::TestWithParam<long> {
protected:
    ~PropertyFileReadError() override { readableBytes = -1; }
};

TEST_P(PropertyFileReadError, EndsTheFileWhereItHappens) {
    const std::string text = "a=1\nb=" + std::string(70000, 'v') + "\nc=3\nd=4\n";
    const testing::TemporaryFile file(text, "failing.properties");
    const testing::TemporaryFile readable(text.substr(0, static_cast<std::size_t>(GetParam())));
    readableBytes = GetParam();
    EXPECT_EQ(testing::readProperties(file), testing::readProperties(readable));
    EXPECT_EQ(readableBytes, 0) << "the file was not read to the failure";
}

INSTANTIATE_TEST_SUITE_P(After, PropertyFileReadError,
                         ::testing::Values(0, 1, 3, 4, 100, 4096, 8191, 8192, 65536, 65537, 70008,
                                           70012));

}  // namespace
}  // namespace velkor::configuration
