#include "host/serving/DroppingBuffer.hpp"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <unistd.h>

#include <array>
#include <ostream>
#include <stdexcept>
#include <string>

namespace velkor::host {
namespace {

constexpr int room = 16384;

/// A pipe with room for four pages.
class SmallPipe {
public:
    SmallPipe() {
        if (::pipe2(ends.data(), O_CLOEXEC) != 0) throw std::runtime_error("no pipe");
        ::fcntl(ends[1], F_SETPIPE_SZ, room);
        ::fcntl(ends[0], F_SETFL, O_NONBLOCK);
    }
    ~SmallPipe() {
        ::close(ends[0]);
        ::close(ends[1]);
    }

    SmallPipe(const SmallPipe&) = delete;
    SmallPipe& operator=(const SmallPipe&) = delete;

    int in() const { return ends[1]; }

    /// What there is in it.
    std::string read() const {
        std::string text;
        std::array<char, 4096> block{};
        for (;;) {
            const ssize_t count = ::read(ends[0], block.data(), block.size());
            if (count <= 0) return text;
            text.append(block.data(), static_cast<std::size_t>(count));
        }
    }

private:
    std::array<int, 2> ends{};
};

class DroppingBufferTest : public ::testing::Test {
protected:
    void write(const std::string& record) { out << record << std::flush; }

    SmallPipe pipe;
    DroppingBuffer buffer{pipe.in()};
    std::ostream out{&buffer};
};

TEST_F(DroppingBufferTest, WritesRecordByRecord) {
    out << "on" << 'e' << '\n';
    EXPECT_EQ(pipe.read(), "");
    out << std::flush;
    EXPECT_EQ(pipe.read(), "one\n");
    write("two\n");
    EXPECT_EQ(pipe.read(), "two\n");
}

TEST_F(DroppingBufferTest, DropsWhatThereIsNoRoomForAndSaysHowMuch) {
    const std::string full = std::string(room - 1, 'x') + '\n';
    write(full);
    write("lost\n");
    write("lost, too\n");
    EXPECT_EQ(pipe.read(), full);
    write("seen\n");
    EXPECT_EQ(pipe.read(), "records dropped since nobody read them in time: 2\nseen\n");
    write("again\n");
    EXPECT_EQ(pipe.read(), "again\n");
}

TEST_F(DroppingBufferTest, EndsTheLineOfARecordThatWasCut) {
    write(std::string(20000, 'x') + '\n');
    EXPECT_EQ(pipe.read(), std::string(room, 'x'));
    write("seen\n");
    EXPECT_EQ(pipe.read(), "\nrecords dropped since nobody read them in time: 1\nseen\n");
}

TEST_F(DroppingBufferTest, StaysUsableWithoutAReader) {
    DroppingBuffer nowhere(-1);
    std::ostream lost(&nowhere);
    lost << "lost\n" << std::flush;
    EXPECT_TRUE(lost.good());
}

}  // namespace
}  // namespace velkor::host
