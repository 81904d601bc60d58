#include "http/detail/transport/ListeningSocket.hpp"

#include <gtest/gtest.h>
#include <sys/stat.h>

#include <cerrno>
#include <filesystem>
#include <string>

#include "http/Refused.hpp"
#include "tests/http/transport/HttpClient.hpp"
#include "tests/support/TemporaryFile.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::http::detail::transport {
namespace {

using velkor::testing::HttpClient;
using velkor::testing::TemporaryFile;
using velkor::testing::thrownText;

// A socket at `path` that nobody listens on any more.
void leaveStale(const std::string& path) {
    const Endpoint endpoint("unix:" + path);
    const Descriptor socket(::socket(AF_UNIX, SOCK_STREAM, 0));
    ASSERT_EQ(::bind(socket.get(), endpoint.data(), endpoint.length()), 0);
}

class UnixSocket : public ::testing::Test {
protected:
    const TemporaryFile file{"text", "file"};
    const std::string path = file.path().string() + ".socket";
    const Endpoint endpoint{"unix:" + path};
};

TEST_F(UnixSocket, IsForItsOwnerOnly) {
    const ListeningSocket listening(endpoint);
    struct stat found {};
    ASSERT_EQ(::lstat(path.c_str(), &found), 0);
    EXPECT_TRUE(S_ISSOCK(found.st_mode));
    EXPECT_EQ(found.st_mode & 0777U, 0600U);
}

TEST_F(UnixSocket, IsRemovedAtTheEnd) {
    { const ListeningSocket listening(endpoint); }
    EXPECT_FALSE(std::filesystem::exists(path));
}

TEST_F(UnixSocket, ThatIsAnotherByNowIsLeftAlone) {
    {
        const ListeningSocket listening(endpoint);
        std::filesystem::rename(path, path + ".moved");
        leaveStale(path);
    }
    EXPECT_TRUE(std::filesystem::exists(path));
}

TEST_F(UnixSocket, ThatNobodyListensOnIsReplaced) {
    leaveStale(path);
    const ListeningSocket listening(endpoint);
    const HttpClient client(path);
    Arrival arrival;
    EXPECT_EQ(listening.accept(arrival), 0);
}

TEST_F(UnixSocket, ThatAnotherListensOnIsNotTaken) {
    const ListeningSocket listening(endpoint);
    EXPECT_EQ(thrownText<Refused>([&] { ListeningSocket{endpoint}; }),
              "can't listen on unix:" + path + ": another process listens there");
    const HttpClient client(path);
    Arrival arrival;
    EXPECT_EQ(listening.accept(arrival), 0);
}

TEST_F(UnixSocket, TakesThePlaceOfNoOtherFile) {
    const Endpoint taken("unix:" + file.path().string());
    EXPECT_EQ(
        thrownText<Refused>([&] { ListeningSocket{taken}; }),
        "can't listen on unix:" + file.path().string() + ": a file that is no socket is there");
    EXPECT_TRUE(std::filesystem::exists(file.path()));
}

TEST_F(UnixSocket, NeedsItsFolder) {
    const Endpoint nowhere("unix:" + path + "/socket");
    EXPECT_EQ(thrownText<Refused>([&] { ListeningSocket{nowhere}; }),
              "can't listen on unix:" + path + "/socket: No such file or directory");
}

TEST(TcpSocket, SaysThePortThatTheSystemPicked) {
    const ListeningSocket listening(Endpoint("127.0.0.1:0"));
    EXPECT_NE(listening.endpoint().port(), 0U);
    const HttpClient client(listening.endpoint().port());
    Arrival arrival;
    EXPECT_EQ(listening.accept(arrival), 0);
    EXPECT_EQ(arrival.from.text().substr(0, 10), "127.0.0.1:");
}

TEST(TcpSocket, SaysThatThePortIsTaken) {
    const ListeningSocket listening(Endpoint("127.0.0.1:0"));
    const std::string text = listening.endpoint().text();
    EXPECT_EQ(thrownText<Refused>([&] { ListeningSocket{Endpoint(text)}; }),
              "can't listen on " + text + ": Address already in use");
}

TEST(TcpSocket, ListensToIpv6) {
    const ListeningSocket listening(Endpoint("[::1]:0"));
    EXPECT_EQ(listening.endpoint().text().substr(0, 6), "[::1]:");
}

TEST(TcpSocket, HasNobodyToTakeAtFirst) {
    const ListeningSocket listening(Endpoint("127.0.0.1:0"));
    Arrival arrival;
    EXPECT_EQ(listening.accept(arrival), EAGAIN);
}

}  // namespace
}  // namespace velkor::http::detail::transport
