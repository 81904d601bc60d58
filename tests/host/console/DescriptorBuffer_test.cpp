#include "host/console/DescriptorBuffer.hpp"

#include <gtest/gtest.h>

#include <cerrno>
#include <csignal>
#include <ostream>
#include <string>

#include "host/console/Interruption.hpp"
#include "tests/host/StreamFile.hpp"

namespace velkor::host {
namespace {

class DescriptorBufferTest : public ::testing::Test {
protected:
    const StreamFile file;
    DescriptorBuffer buffer{file.descriptor()};
    std::ostream out{&buffer};
};

TEST_F(DescriptorBufferTest, WritesAtOnce) {
    out << "text" << 5 << 'c';
    EXPECT_EQ(file.content(), "text5c");
}

TEST_F(DescriptorBufferTest, WritesALongTextWhole) {
    const std::string text(1'000'000, 'x');
    out << text;
    EXPECT_TRUE(out.good());
    EXPECT_EQ(file.content(), text);
}

TEST_F(DescriptorBufferTest, WritesNothingWhileAnInterruptionIsRequested) {
    const Interruption interruption;
    std::raise(SIGINT);
    errno = 0;
    out << "text";
    EXPECT_TRUE(out.bad());
    EXPECT_EQ(errno, EINTR);
    EXPECT_EQ(file.content(), "");
}

TEST(DescriptorBuffer, LeavesTheReasonOfAFailure) {
    DescriptorBuffer buffer(-1);
    std::ostream out(&buffer);
    errno = 0;
    out << 'c';
    EXPECT_TRUE(out.bad());
    EXPECT_EQ(errno, EBADF);
}

}  // namespace
}  // namespace velkor::host
