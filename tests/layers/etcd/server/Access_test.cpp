// Who may read and write, and over what.

#include <gmock/gmock.h>
#include <gtest/gtest.h>

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
#include "tests/support/Thrown.hpp"

namespace velkor::testing {
namespace {

using ::testing::AnyOf;
using ::testing::Each;
using ::testing::HasSubstr;
using ::testing::Not;

class EtcdUsers : public ::testing::Test {
protected:
    EtcdUsers() {
        options.user = "app";
        options.passwordFile = password.path().string();
        EtcdMember& member = cluster[0];
        member.ctl("user add root:root");
        member.ctl("user grant-role root root");
        member.ctl("role add app");
        member.ctl("role grant-permission app --prefix=true readwrite p/rw/");
        member.ctl("role grant-permission app --prefix=true read p/");
        member.ctl("user add app:tops3cret");
        member.ctl("user grant-role app app");
        member.ctl("auth enable");
        member.ctlOptions("--user=root:root");
        member.ctl("put p/a 1");
    }

    static std::vector<std::string> shortTokens() { return {"--auth-token-ttl=1"}; }

    EtcdCluster cluster{1, shortTokens()};
    const TemporaryFile password{"tops3cret\n"};
    EtcdOptions options;
};

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
    options.startWithin = std::chrono::seconds(2);
    const std::string problem =
        thrownText<std::runtime_error>([&] { EtcdSource::open(cluster.urls(), "p/", options); });
    EXPECT_EQ(problem, "etcd could not be read: " + cluster[0].url() +
                           ": etcdserver: authentication failed, invalid user ID or password");
    EXPECT_THAT(log.messages(), Each(Not(HasSubstr("wr0ng"))));
}

TEST_F(EtcdUsers, MayChangeTheirPassword) {
    FaultProxy proxy(cluster[0].port());
    FleetProcess fleet({proxy.url()}, "p/", options);
    cluster[0].ctl("user delete app");
    cluster[0].ctl("user add app:n3w");
    cluster[0].ctl("user grant-role app app");
    password.rewrite("n3w");
    proxy.cutOnce();
    cluster[0].ctl("put p/a 2");
    EXPECT_TRUE(fleet.shows("a", "string 2"));
}

TEST_F(EtcdUsers, NeedAFileWithThePassword) {
    options.passwordFile = password.path().string() + ".none";
    options.startWithin = std::chrono::milliseconds(500);
    EXPECT_EQ(
        thrownText<std::runtime_error>([&] { EtcdSource::open(cluster.urls(), "p/", options); }),
        "etcd could not be read: " + cluster[0].url() + ": can't read the password in " +
            options.passwordFile);
}

TEST_F(EtcdUsers, AreNeededWhereTheServerAsksForThem) {
    EtcdOptions without;
    without.startWithin = std::chrono::milliseconds(500);
    EXPECT_THAT(
        thrownText<std::runtime_error>([&] { EtcdSource::open(cluster.urls(), "p/", without); }),
        HasSubstr("etcdserver: user name is empty"));
}

/// A member that speaks TLS, and demands a certificate of its clients.
class EtcdTls : public ::testing::Test {
protected:
    EtcdTls() {
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
        member->start();
        if (!comesAbout([this] { return member->answers(); })) {
            throw std::runtime_error("etcd doesn't start");
        }
        member->ctl("put p/a 1");
        options.caFile = file("ca.pem");
        options.certificateFile = file("client.pem");
        options.keyFile = file("client.key");
        options.startWithin = patience;
    }

    std::string file(const std::string& name) const { return (folder.path() / name).string(); }

    void makeAuthority(const std::string& name) const {
        outputOf(
            "openssl req -x509 -newkey ec -pkeyopt ec_paramgen_curve:P-256 -nodes -days 2 "
            "-subj /CN=" +
            name + " -keyout " + file(name + ".key") + " -out " + file(name + ".pem"));
    }

    void makeCertificate(const std::string& name) const {
        outputOf("openssl req -newkey ec -pkeyopt ec_paramgen_curve:P-256 -nodes -subj /CN=" +
                 name + " -keyout " + file(name + ".key") + " -out " + file(name + ".csr"));
        outputOf(
            "printf 'subjectAltName=IP:127.0.0.1\\nextendedKeyUsage=serverAuth,clientAuth' > " +
            file("extensions"));
        outputOf("openssl x509 -req -days 2 -in " + file(name + ".csr") + " -CA " + file("ca.pem") +
                 " -CAkey " + file("ca.key") + " -CAcreateserial -extfile " + file("extensions") +
                 " -out " + file(name + ".pem"));
    }

    std::string problem() {
        options.startWithin = std::chrono::milliseconds(700);
        return thrownText<std::runtime_error>(
            [&] { EtcdSource::open({member->url()}, "p/", options); });
    }

    const ServerFolder folder;
    std::unique_ptr<EtcdMember> member;
    EtcdOptions options;
};

TEST_F(EtcdTls, IsSpoken) {
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
    options.startWithin = std::chrono::milliseconds(700);
    EXPECT_THAT(thrownText<std::runtime_error>([&] { EtcdSource::open({byName}, "p/", options); }),
                HasSubstr(": the certificate is not trusted: "));
}

TEST_F(EtcdTls, IsRefusedByTheServerWithoutACertificate) {
    options.certificateFile.clear();
    options.keyFile.clear();
    EXPECT_THAT(problem(), HasSubstr("etcd could not be read: " + member->url()));
}

TEST_F(EtcdTls, NamesTheFileThatIsMissing) {
    options.caFile = file("none.pem");
    EXPECT_THAT(problem(), HasSubstr("can't use the CA file " + file("none.pem") +
                                     ": No such file or directory"));
}

}  // namespace
}  // namespace velkor::testing
