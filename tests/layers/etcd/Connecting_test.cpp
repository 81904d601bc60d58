#include "layers/etcd/detail/Connecting.hpp"

#include <arpa/inet.h>
#include <gtest/gtest.h>
#include <netinet/in.h>
#include <poll.h>
#include <sys/socket.h>
#include <unistd.h>

#include <chrono>
#include <stdexcept>
#include <string>
#include <vector>

#include "layers/etcd/detail/GatewayErrors.hpp"
#include "tests/support/BoundedWait.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::layers::etcd {
namespace {

using std::chrono::milliseconds;
using testing::thrownText;
using Clock = std::chrono::steady_clock;

/// A place on the loopback interface, which may be one of several in a chain.
class Place {
public:
    Place() : socket(::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
        name.sin_family = AF_INET;
        name.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
        socklen_t size = sizeof name;
        if (::bind(socket, generic(), size) != 0 || ::getsockname(socket, generic(), &size) != 0) {
            throw std::runtime_error("no port is free");
        }
        address.ai_family = AF_INET;
        address.ai_addr = generic();
        address.ai_addrlen = sizeof name;
    }
    ~Place() {
        for (const int each : waiting) ::close(each);
        ::close(socket);
    }
    Place(const Place&) = delete;
    Place& operator=(const Place&) = delete;

    void listen() const { ASSERT_EQ(::listen(socket, 16), 0); }

    /// So many connections wait to be accepted that no more are answered.
    void fallSilent() {
        ASSERT_EQ(::listen(socket, 0), 0);
        for (bool isAnswered = true; isAnswered;) {
            waiting.push_back(::socket(AF_INET, SOCK_STREAM | SOCK_NONBLOCK | SOCK_CLOEXEC, 0));
            ::connect(waiting.back(), generic(), sizeof name);
            pollfd awaited{waiting.back(), POLLOUT, 0};
            isAnswered = ::poll(&awaited, 1, 200) > 0;
        }
    }

    Place& before(Place& next) {
        address.ai_next = &next.address;
        return *this;
    }

    bool isPeerOf(int connected) const {
        sockaddr_in peer{};
        socklen_t size = sizeof peer;
        ::getpeername(connected, reinterpret_cast<sockaddr*>(&peer), &size);
        return peer.sin_port == name.sin_port;
    }

    addrinfo address{};

private:
    sockaddr* generic() { return reinterpret_cast<sockaddr*>(&name); }

    const int socket;
    sockaddr_in name{};
    std::vector<int> waiting;
};

class ConnectingTest : public ::testing::Test {
protected:
    ~ConnectingTest() override {
        if (connected >= 0) ::close(connected);
    }

    int connect(const Place& first, Clock::duration within = testing::patience) {
        connected = connectToOne(first.address, stop, Clock::now() + within);
        return connected;
    }

    Stop stop;
    Place place;
    Place other;

private:
    int connected = -1;
};

TEST_F(ConnectingTest, TakesTheFirstAddressThatAnswers) {
    place.listen();
    other.listen();
    EXPECT_TRUE(place.isPeerOf(connect(place.before(other))));
}

TEST_F(ConnectingTest, PassesAnAddressThatRefuses) {
    other.listen();
    EXPECT_TRUE(other.isPeerOf(connect(place.before(other))));
}

TEST_F(ConnectingTest, LeavesTimeForTheAddressAfterOneThatNeverAnswers) {
    place.fallSilent();
    other.listen();
    EXPECT_TRUE(other.isPeerOf(connect(place.before(other), milliseconds(2000))));
}

TEST_F(ConnectingTest, SaysWhyTheLastAddressRefused) {
    EXPECT_EQ(thrownText<Unreachable>([&] { connect(other.before(place)); }), "Connection refused");
}

TEST_F(ConnectingTest, SaysThatTheLastAddressDidNotAnswer) {
    place.fallSilent();
    EXPECT_EQ(thrownText<Unreachable>([&] { connect(place, milliseconds(1)); }),
              "Connection timed out");
}

TEST_F(ConnectingTest, EndsWithTheSource) {
    place.fallSilent();
    stop.request();
    EXPECT_THROW(connect(place), Stopped);
}

}  // namespace
}  // namespace velkor::layers::etcd
