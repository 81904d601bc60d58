// Who may read and write, and over what.

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <chrono>
#include <filesystem>
#include <memory>
#include <stdexcept>
#include <string>
#include <vector>

#include "layers/etcd/EtcdSource.hpp"
#include "tests/layers/etcd/server/EtcdMember.hpp"
#include "tests/layers/etcd/server/FaultProxy.hpp"
#include "tests/layers/etcd/server/FleetProcess.hpp"
#include "tests/support/LogCapture.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::testing {
namespace {

using ::testing::Each;
using ::testing::HasSubstr;
using ::testing::Not;

bool startsWith(const std::string& text, const std::string& begin) {
    return text.compare(0, begin.size(), begin) == 0;
}

/// Why a source that begins without its server doesn't find it.
std::string problemOf(const std::string& url, EtcdOptions options) {
    options.startWithin = std::chrono::milliseconds(0);
    options.withoutServer = layers::StartWithoutServer::empty;
    const auto source = EtcdSource::open({url}, "p/", options);
    EXPECT_TRUE(comesAbout([&] { return startsWith(source->state().lastError, url); }));
    EXPECT_FALSE(source->state().isWell);
    return source->state().lastError.substr(url.size());
}

class EtcdUsers : public ::testing::Test {
protected:
    static void SetUpTestSuite() {
        // Tokens of a second, and passwords that are checked in no time.
        shared = std::make_unique<EtcdCluster>(
            1, std::vector<std::string>{"--auth-token-ttl=1", "--bcrypt-cost=4"});
        EtcdMember& member = (*shared)[0];
        member.ctl("user add root:root");
        member.ctl("user grant-role root root");
        member.ctl("role add app");
        member.ctl("role grant-permission app --prefix=true readwrite p/rw/");
        member.ctl("role grant-permission app --prefix=true read p/");
        member.ctl("user add app:tops3cret");
        member.ctl("user grant-role app app");
        member.ctl("auth enable");
        member.ctlOptions("--user=root:root");
    }
    static void TearDownTestSuite() { shared.reset(); }

    EtcdUsers() {
        options.user = "app";
        options.passwordFile = password.path().string();
        cluster[0].ctl("put p/a 1");
    }

    static std::unique_ptr<EtcdCluster> shared;
    EtcdCluster& cluster = *shared;
    const TemporaryFile password{"tops3cret\n"};
    EtcdOptions options;
};

std::unique_ptr<EtcdCluster> EtcdUsers::shared;

TEST_F(EtcdUsers, AreAuthenticated) {
    FleetProcess fleet(cluster.urls(), "p/", options);
    EXPECT_EQ(fleet.at("a"), "string 1");
    fleet.store->set("rw/b", 1);
    EXPECT_EQ(fleet.refusal(), "");
    cluster[0].ctl("put p/a 2");
    EXPECT_TRUE(fleet.shows("a", "string 2"));
}

TEST_F(EtcdUsers, AreAuthenticatedAgainWhenTheTokenIsTooOld) {
    FaultProxy proxy(cluster[0].port());
    FleetProcess fleet({proxy.url()}, "p/", options);
    fleet.store->set("rw/b", 1);
    ASSERT_EQ(fleet.refusal(), "");
    const int before = proxy.count();
    int value = 1;
    // The member forgets tokens of a second in its own time.
    EXPECT_TRUE(comesAbout([&] {
        std::this_thread::sleep_for(std::chrono::milliseconds(1500));
        fleet.store->set("rw/b", ++value);
        EXPECT_EQ(fleet.refusal(), "");
        return proxy.count() > before;
    }));
    EXPECT_TRUE(fleet.shows("rw/b", "int " + std::to_string(value)));
}

TEST_F(EtcdUsers, AreRefusedWhatTheyMayNotWrite) {
    FleetProcess fleet(cluster.urls(), "p/", options);
    fleet.store->set("a", 2);
    EXPECT_EQ(fleet.refusal(), "etcd refused the write: etcdserver: permission denied");
    EXPECT_TRUE(fleet.shows("a", "string 1"));
}

TEST_F(EtcdUsers, AreRefusedWithAWrongPassword) {
    const LogCapture log("velkor::layers::etcd");
    password.rewrite("wr0ng");
    EXPECT_EQ(problemOf(cluster[0].url(), options),
              ": etcdserver: authentication failed, invalid user ID or password");
    EXPECT_THAT(log.messages(), Each(Not(HasSubstr("wr0ng"))));
}

TEST_F(EtcdUsers, MayChangeTheirPassword) {
    FaultProxy proxy(cluster[0].port());
    cluster[0].ctl("user add changing:tops3cret");
    cluster[0].ctl("user grant-role changing app");
    options.user = "changing";
    FleetProcess fleet({proxy.url()}, "p/", options);
    cluster[0].ctl("user delete changing");
    cluster[0].ctl("user add changing:n3w");
    cluster[0].ctl("user grant-role changing app");
    password.rewrite("n3w");
    proxy.cutOnce();
    cluster[0].ctl("put p/a 2");
    EXPECT_TRUE(fleet.shows("a", "string 2"));
}

TEST_F(EtcdUsers, NeedAFileWithThePassword) {
    options.passwordFile = password.path().string() + ".none";
    EXPECT_EQ(problemOf(cluster[0].url(), options),
              ": can't read the password in " + options.passwordFile);
}

TEST_F(EtcdUsers, DoNotWaitForWhoeverWritesAPasswordIntoAPipe) {
    const ServerFolder folder;
    options.passwordFile = (folder.path() / "pipe").string();
    ASSERT_EQ(::mkfifo(options.passwordFile.c_str(), 0600), 0);
    EXPECT_EQ(problemOf(cluster[0].url(), options),
              ": can't read the password in " + options.passwordFile);
}

TEST_F(EtcdUsers, AreNeededWhereTheServerAsksForThem) {
    EXPECT_THAT(problemOf(cluster[0].url(), {}), HasSubstr("etcdserver: user name is empty"));
}

/// A member that speaks TLS, and demands a certificate of its clients.
class EtcdTls : public ::testing::Test {
protected:
    static void SetUpTestSuite() {
        folder = std::make_unique<ServerFolder>();
        makeAuthority("ca");
        makeAuthority("other");
        makeCertificate("server");
        makeCertificate("client");
        const int peers = freePort();
        member = std::make_unique<EtcdMember>(
            "m0", freePort(), peers, "m0=http://127.0.0.1:" + std::to_string(peers),
            std::vector<std::string>{"--cert-file=" + file("server.pem"),
                                     "--key-file=" + file("server.key"), "--client-cert-auth",
                                     "--trusted-ca-file=" + file("ca.pem")});
        member->useTls();
        member->ctlOptions("--cacert=" + file("ca.pem") + " --cert=" + file("client.pem") +
                           " --key=" + file("client.key"));
        member->revive();
        member->ctl("put p/a 1");
    }

    static void TearDownTestSuite() {
        member.reset();
        folder.reset();
    }

    EtcdTls() {
        options.caFile = file("ca.pem");
        options.certificateFile = file("client.pem");
        options.keyFile = file("client.key");
    }

    static std::string file(const std::string& name) { return (folder->path() / name).string(); }

    static void makeAuthority(const std::string& name) {
        outputOf(
            "openssl req -x509 -newkey ec -pkeyopt ec_paramgen_curve:P-256 -nodes -days 2 "
            "-subj /CN=" +
            name + " -keyout " + file(name + ".key") + " -out " + file(name + ".pem"));
    }

    static void makeCertificate(const std::string& name) {
        outputOf("openssl req -newkey ec -pkeyopt ec_paramgen_curve:P-256 -nodes -subj /CN=" +
                 name + " -keyout " + file(name + ".key") + " -out " + file(name + ".csr"));
        outputOf(
            "printf 'subjectAltName=IP:127.0.0.1\\nextendedKeyUsage=serverAuth,clientAuth' > " +
            file("extensions"));
        outputOf("openssl x509 -req -days 2 -in " + file(name + ".csr") + " -CA " + file("ca.pem") +
                 " -CAkey " + file("ca.key") + " -CAcreateserial -extfile " + file("extensions") +
                 " -out " + file(name + ".pem"));
    }

    std::string problem() const { return problemOf(member->url(), options); }

    static std::unique_ptr<ServerFolder> folder;
    static std::unique_ptr<EtcdMember> member;
    EtcdOptions options;
};

std::unique_ptr<ServerFolder> EtcdTls::folder;
std::unique_ptr<EtcdMember> EtcdTls::member;

TEST_F(EtcdTls, IsSpoken) {
    member->ctl("put p/a 1");
    FleetProcess fleet({member->url()}, "p/", options);
    EXPECT_EQ(fleet.at("a"), "string 1");
    fleet.store->set("b", std::string(100'000, 'x'));
    EXPECT_EQ(fleet.refusal(), "");
    member->ctl("put p/a 2");
    EXPECT_TRUE(fleet.shows("a", "string 2"));
}

TEST_F(EtcdTls, IsRefusedWithACertificateThatIsNotTrusted) {
    options.caFile = file("other.pem");
    EXPECT_THAT(problem(), HasSubstr(": the certificate is not trusted: "));
}

TEST_F(EtcdTls, IsRefusedWithACertificateOfAnotherHost) {
    const std::string byName = "https://localhost:" + std::to_string(member->port());
    EXPECT_THAT(problemOf(byName, options), HasSubstr(": the certificate is not trusted: "));
}

TEST_F(EtcdTls, IsRefusedByTheServerWithoutACertificate) {
    options.certificateFile.clear();
    options.keyFile.clear();
    EXPECT_NE(problem(), "");
}

TEST_F(EtcdTls, NamesTheFileThatIsMissing) {
    options.caFile = file("none.pem");
    EXPECT_THAT(problem(), HasSubstr("can't use the CA file " + file("none.pem") +
                                     ": No such file or directory"));
}

}  // namespace
}  // namespace velkor::testing
