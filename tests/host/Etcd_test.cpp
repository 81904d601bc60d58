#include <arpa/inet.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

#include <filesystem>
#include <memory>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include "tests/host/TerminalSession.hpp"
#include "tests/layers/etcd/server/EtcdMember.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::host {
namespace {

using ::testing::HasSubstr;
using ::testing::Not;
using velkor::testing::EtcdCluster;
using velkor::testing::EtcdMember;
using velkor::testing::ServerFolder;
using velkor::testing::TemporaryFile;
using Words = std::vector<std::string>;

constexpr const char* prompt = "velkor> ";

/// Watches `key` and waits for its value.
void watchKey(TerminalSession& terminal, const std::string& key, const std::string& value) {
    EXPECT_TRUE(terminal.shows(prompt));
    terminal.type("watch " + key + "\n");
    EXPECT_TRUE(terminal.shows("\r\n" + key + " = " + value + "\r\nvelkor> "));
}

/// Layers of the program on one member, which stays up. Each test has keys of its own.
class EtcdLayerTest : public ::testing::Test {
protected:
    static void SetUpTestSuite() { cluster = std::make_unique<EtcdCluster>(); }
    static void TearDownTestSuite() { cluster.reset(); }

    static EtcdMember& member() { return (*cluster)[0]; }

    std::string layer(const std::string& settings = "") const {
        return member().url() + ",wait=20s,prefix=" + prefix + settings;
    }

    /// What etcdctl says to a command about `key`, with what follows.
    std::string ctl(const std::string& command, const std::string& key,
                    const std::string& more = "") const {
        return member().ctl(command + ' ' + prefix + key + ' ' + more);
    }

    /// One command on the writable layer.
    ChildResult write(Words command) const {
        Words arguments{"--etcd", layer(",writable"), "--"};
        arguments.insert(arguments.end(), command.begin(), command.end());
        arguments.insert(arguments.end(), {"--source", "etcd"});
        return runProgram(arguments);
    }

    static std::unique_ptr<EtcdCluster> cluster;

    const std::string prefix =
        std::string("/") + ::testing::UnitTest::GetInstance()->current_test_info()->name() + "/";
};

std::unique_ptr<EtcdCluster> EtcdLayerTest::cluster;

TEST_F(EtcdLayerTest, ShowsInOneConsoleWhatAnotherHasPut) {
    ctl("put", "port", "1");
    TerminalSession watching({"--etcd", layer()});
    watchKey(watching, "port", "'1'");
    EXPECT_EQ(write({"put", "port", "8443"}).err, "");
    EXPECT_TRUE(watching.shows("\r\nport = 8443\r\nvelkor> "));
    EXPECT_EQ(write({"put", "port", "a b"}).err, "");
    EXPECT_TRUE(watching.shows("\r\nport = 'a b'\r\nvelkor> "));
}

TEST_F(EtcdLayerTest, ShowsWhatEtcdctlHasPut) {
    ctl("put", "mode", "ordinary");
    TerminalSession watching({"--etcd", layer()});
    watchKey(watching, "mode", "'ordinary'");
    ctl("put", "mode", "maintenance");
    EXPECT_TRUE(watching.shows("\r\nmode = 'maintenance'\r\nvelkor> "));
    ctl("put", "mode", R"('{"type":"int","value":7}')");
    EXPECT_TRUE(watching.shows("\r\nmode = 7\r\nvelkor> "));
}

TEST_F(EtcdLayerTest, EndsAWriteWhenTheServerHasIt) {
    const auto put = write({"put", "port", "8443"});
    EXPECT_EQ(put.exitCode, 0);
    EXPECT_EQ(put.err, "");
    EXPECT_EQ(ctl("get --print-value-only", "port"), "{\"type\":\"int\",\"value\":8443}\n");
    const auto unset = write({"unset", "port"});
    EXPECT_EQ(unset.exitCode, 0);
    EXPECT_EQ(unset.err, "");
    EXPECT_EQ(ctl("get --print-value-only", "port"), "");
}

TEST_F(EtcdLayerTest, IsNotWrittenUnlessTheCommandLineAllowsThat) {
    const auto result =
        runProgram({"--etcd", layer(), "--", "put", "port", "1", "--source", "etcd"});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_THAT(result.err, HasSubstr("velkor-config: put: "));
    EXPECT_EQ(ctl("get --print-value-only", "port"), "");
}

TEST_F(EtcdLayerTest, StandsBetweenTheCommandLineAndTheFiles) {
    ctl("put", "port", "2");
    const TemporaryFile file("port=3\n", "file.properties");
    const auto result = runProgram(
        {"--set", "port=1", "--etcd", layer(), file.path().string(), "-c", "explain port"});
    EXPECT_EQ(result.out,
              "effective   command-line  1\n"
              "overridden  etcd          '2'\n"
              "overridden  file          '3'\n");
}

TEST_F(EtcdLayerTest, MayBeOneOfSeveralOfWhichTheLaterWins) {
    ctl("put", "all/port", "1");
    ctl("put", "canary/port", "2");
    const auto result =
        runProgram({"--etcd", layer() + "all/", "--etcd", layer() + "canary/,group=g", "--etcd",
                    layer() + "canary/,name=canary", "-c", "explain port", "-c", "explain g.port"});
    EXPECT_EQ(result.out,
              "effective   canary  '2'\n"
              "overridden  etcd    '1'\n"
              "effective  etcd-2  '2'\n");
}

TEST_F(EtcdLayerTest, SaysHowItStands) {
    ctl("put", "port", "1");
    const auto result = runProgram({"--etcd", layer(), "-c", "sources", "-c", "sources --json"});
    EXPECT_THAT(result.out, HasSubstr("NAME      GROUP  ORDER       ACCESS     STATE\n"
                                      "override  -      0           writable\n"
                                      "etcd      -      300         read-only  since 20"));
    EXPECT_THAT(result.out, HasSubstr("Z, endpoint " + member().url() + ", revision "));
    EXPECT_THAT(result.out, HasSubstr(R"("readOnly":true,"state":{"details":{"endpoint":")" +
                                      member().url() + R"(","revision":")"));
    EXPECT_THAT(result.out, HasSubstr(R"(Z","well":true})"));
    EXPECT_THAT(result.out, Not(HasSubstr("PROBLEM")));
}

/// A port of the loopback interface on which nobody listens, and nobody can.
class DeafPort {
public:
    DeafPort() : socket(::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
        sockaddr_in address{};
        address.sin_family = AF_INET;
        address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
        socklen_t size = sizeof address;
        if (::bind(socket, reinterpret_cast<sockaddr*>(&address), sizeof address) != 0 ||
            ::getsockname(socket, reinterpret_cast<sockaddr*>(&address), &size) != 0) {
            throw std::runtime_error("no port");
        }
        number = ntohs(address.sin_port);
    }
    ~DeafPort() { ::close(socket); }

    DeafPort(const DeafPort&) = delete;
    DeafPort& operator=(const DeafPort&) = delete;

    std::string url() const { return "http://127.0.0.1:" + std::to_string(number); }

private:
    const int socket;
    int number = 0;
};

/// Layers of the program whose server is absent when it starts.
class AbsentEtcdTest : public ::testing::Test {
protected:
    ChildResult get(const std::string& settings) const {
        return runProgram({"--etcd", port.url() + ",prefix=/p/,wait=50ms," + settings, "-c",
                           "get port", "-c", "sources"});
    }

    // Without the reason: what an attempt to connect met, or that there was no time for one.
    static std::string told(const ChildResult& result) {
        const std::string program = "velkor-config: ";
        return result.err.substr(program.size(),
                                 result.err.find(": ", program.size()) - program.size());
    }

    const DeafPort port;
};

TEST_F(AbsentEtcdTest, FailsUnlessToldOtherwise) {
    const auto result = get("without-server=fail");
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_EQ(told(result), "etcd could not be read");
    EXPECT_THAT(result.out, Not(HasSubstr("etcd")));
    EXPECT_THAT(result.out, HasSubstr("No configuration option with key: port\n"));
}

TEST_F(AbsentEtcdTest, MayBeginEmptyAndSaysSo) {
    const auto result = get("without-server=empty");
    EXPECT_EQ(result.exitCode, 0);
    EXPECT_EQ(told(result), "etcd began without its server");
    EXPECT_THAT(result.out, HasSubstr("No configuration option with key: port\n"));
    EXPECT_THAT(result.out, HasSubstr("ACCESS     PROBLEM\n"));
    EXPECT_THAT(result.out, HasSubstr("etcd      -      300         read-only  since 20"));
}

TEST_F(AbsentEtcdTest, MayBeginWithTheLastKnownValuesAndSaysSo) {
    const ServerFolder folder;
    const std::string file = (folder.path() / "known").string();
    {
        EtcdCluster cluster;
        cluster[0].ctl("put /p/port 80");
        const auto result =
            runProgram({"--etcd", cluster[0].url() + ",wait=20s,prefix=/p/,last-known=" + file,
                        "-c", "get port"});
        ASSERT_EQ(result.out, "'80'\n");
    }
    const auto result = get("last-known=" + file);
    EXPECT_EQ(result.exitCode, 0);
    EXPECT_EQ(told(result), "etcd began without its server");
    EXPECT_THAT(result.out, HasSubstr("'80'\n"));
    EXPECT_THAT(result.out, HasSubstr("ACCESS     STATE       PROBLEM\n"));
    EXPECT_THAT(result.out, HasSubstr("  revision 2  since 20"));
}

TEST_F(AbsentEtcdTest, FailsWithoutLastKnownValues) {
    const auto result = get("last-known=/no/file");
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_EQ(told(result), "etcd could not be read");
    EXPECT_THAT(result.err, HasSubstr("; /no/file: "));
    EXPECT_THAT(result.out, Not(HasSubstr("etcd")));
}

TEST_F(AbsentEtcdTest, FailsAWriteAndSaysWhy) {
    const auto result =
        runProgram({"--etcd", port.url() + ",wait=50ms,without-server=empty,writable", "-c",
                    "put port 1 --source etcd", "-c", "get port"});
    EXPECT_EQ(result.exitCode, 1);
    EXPECT_THAT(result.err, HasSubstr("\nvelkor-config: put: etcd refused the write: the write was "
                                      "not sent: "));
    EXPECT_EQ(result.out, "No configuration option with key: port\n");
}

TEST(EtcdEndpoint, ThatIsNoneIsNamed) {
    const auto result = runProgram({"--etcd", "http://a:123456", "-c", "get port"});
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_EQ(result.err,
              "velkor-config: Not an etcd endpoint: http://a:123456; http://HOST:PORT or "
              "https://HOST:PORT is needed\n");
}

TEST(EtcdServer, ThatGoesAwayIsShownUntilItIsBack) {
    EtcdCluster cluster;
    EtcdMember& member = cluster[0];
    member.ctl("put /p/port 80");
    TerminalSession terminal({"--etcd", member.url() + ",wait=20s,prefix=/p/"});
    watchKey(terminal, "port", "'80'");
    member.kill();
    EXPECT_TRUE(terminal.showsAfterPressing("sources\n", "PROBLEM\r\n"));
    EXPECT_TRUE(terminal.shows("etcd      -      300         read-only  revision "));
    EXPECT_TRUE(terminal.shows("Z: " + member.url() + ": "));
    EXPECT_TRUE(terminal.shows(prompt));
    terminal.type("get port\n");
    EXPECT_TRUE(terminal.shows("\r\n'80'\r\nvelkor> "));
    member.start();
    EXPECT_TRUE(terminal.showsAfterPressing("sources\n", "Z, endpoint " + member.url() + ", "));
    member.ctl("put /p/port 81");
    EXPECT_TRUE(terminal.shows("\r\nport = '81'\r\n"));
}

}  // namespace
}  // namespace velkor::host
