#include "host/sources/EtcdOption.hpp"

#include <gtest/gtest.h>

#include <chrono>
#include <ostream>
#include <string>
#include <vector>

#include "host/Options.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::host {
namespace {

using layers::StartWithoutServer;
using std::chrono::milliseconds;
using velkor::testing::thrownText;
using Words = std::vector<std::string>;

const std::string url = "http://a:2379";

EtcdRequest etcdOf(const std::string& settings) {
    return parseEtcd(url + settings).etcd.value();
}

TEST(EtcdOption, NeedsOneUrlOnly) {
    const auto source = parseEtcd(url);
    EXPECT_EQ(source.kind, "etcd");
    EXPECT_EQ(source.name, std::nullopt);
    EXPECT_EQ(source.location, url);
    EXPECT_EQ(source.group, "");
    EXPECT_EQ(source.order, 300);
    EXPECT_FALSE(source.writable);
    EXPECT_EQ(source.etcd->endpoints, Words{url});
    EXPECT_EQ(source.etcd->prefix, "");
}

TEST(EtcdOption, LeavesTheRestAsItUsuallyIs) {
    const layers::EtcdOptions usual;
    const auto options = etcdOf("").options;
    EXPECT_EQ(options.startWithin, usual.startWithin);
    EXPECT_EQ(options.withoutServer, StartWithoutServer::fail);
    EXPECT_EQ(options.lastKnownFile, "");
    EXPECT_FALSE(options.compareAndSwap);
    EXPECT_EQ(options.caFile + options.certificateFile + options.keyFile, "");
    EXPECT_EQ(options.user + options.passwordFile, "");
}

TEST(EtcdOption, MayHaveSeveralUrlsInAnyPlace) {
    const auto source = parseEtcd("prefix=/p/,https://a:1,writable,http://[::1]:2,https://c/");
    EXPECT_EQ(source.etcd->endpoints, (Words{"https://a:1", "http://[::1]:2", "https://c/"}));
    EXPECT_EQ(source.etcd->prefix, "/p/");
    EXPECT_TRUE(source.writable);
}

TEST(EtcdOption, HasWhatEverySourceHas) {
    const auto source = parseEtcd(url + ",name=fleet,group=g,order=-5,writable");
    EXPECT_EQ(source.name, "fleet");
    EXPECT_EQ(source.group, "g");
    EXPECT_EQ(source.order, -5);
    EXPECT_TRUE(source.writable);
}

TEST(EtcdOption, TakesAPrefixAsItIs) {
    EXPECT_EQ(etcdOf(",prefix=a=b@c http://").prefix, "a=b@c http://");
    EXPECT_EQ(etcdOf(",prefix=").prefix, "");
}

TEST(EtcdOption, NamesTheFilesOfTls) {
    const auto options =
        parseEtcd("https://a,ca=ca.pem,cert=client.pem,key=client.key").etcd->options;
    EXPECT_EQ(options.caFile, "ca.pem");
    EXPECT_EQ(options.certificateFile, "client.pem");
    EXPECT_EQ(options.keyFile, "client.key");
}

TEST(EtcdOption, NamesTheUserAndTheFileOfThePassword) {
    const auto options = etcdOf(",user=app@shop,password-file=a=b").options;
    EXPECT_EQ(options.user, "app@shop");
    EXPECT_EQ(options.passwordFile, "a=b");
}

TEST(EtcdOption, SaysHowLongTheServerIsWaitedFor) {
    EXPECT_EQ(etcdOf(",wait=250ms").options.startWithin, milliseconds(250));
    EXPECT_EQ(etcdOf(",wait=1min").options.startWithin, milliseconds(60'000));
    EXPECT_EQ(etcdOf(",wait=0s").options.startWithin, milliseconds(0));
}

TEST(EtcdOption, SaysWhatHappensWithoutAServer) {
    EXPECT_EQ(etcdOf(",without-server=fail").options.withoutServer, StartWithoutServer::fail);
    EXPECT_EQ(etcdOf(",without-server=empty").options.withoutServer, StartWithoutServer::empty);
    const auto known = etcdOf(",without-server=last-known,last-known=f").options;
    EXPECT_EQ(known.withoutServer, StartWithoutServer::lastKnown);
    EXPECT_EQ(known.lastKnownFile, "f");
}

TEST(EtcdOption, WithAFileOfLastKnownValuesBeginsWithThoseUnlessToldOtherwise) {
    EXPECT_EQ(etcdOf(",last-known=f").options.withoutServer, StartWithoutServer::lastKnown);
    EXPECT_EQ(etcdOf(",last-known=f,without-server=fail").options.withoutServer,
              StartWithoutServer::fail);
    EXPECT_EQ(etcdOf(",without-server=empty,last-known=f").options.withoutServer,
              StartWithoutServer::empty);
}

TEST(EtcdOption, MayRefuseToWriteOverWhatItHasNotSeen) {
    EXPECT_TRUE(etcdOf(",writable,compare-and-swap").options.compareAndSwap);
}

TEST(EtcdOption, KeepsItsPlaceAmongTheSources) {
    Words locations;
    for (const auto& source :
         parseOptions({"a", "--etcd", url + ",prefix=x", "--source", "n=b", "--etcd=https://c"})
             .sources) {
        locations.push_back(source.location);
    }
    EXPECT_EQ(locations, (Words{"a", url, "b", "https://c"}));
}

TEST(EtcdOption, MayBeInBrackets) {
    EXPECT_EQ(thrownText<UsageError>([] {
                  parseOptions({"--etcd", "[a,b]"});
              }),
              "--etcd: a URL is needed, such as http://HOST:PORT or https://HOST:PORT");
}

struct BadEtcd {
    const char* name;
    std::string text;
    std::string message;

    friend std::ostream& operator<<(std::ostream& out, const BadEtcd& it) { return out << it.name; }
};

BadEtcd badSetting(const char* name, const std::string& settings, const std::string& reason) {
    return {name, url + "," + settings, "--etcd " + url + ": " + reason};
}

BadEtcd noUrl(const char* name, const std::string& text) {
    return {name, text, "--etcd: a URL is needed, such as http://HOST:PORT or https://HOST:PORT"};
}

BadEtcd userInUrl(const char* name, const std::string& text) {
    return {name, text,
            "--etcd: a URL takes no user and no password; user=NAME and password-file=FILE name "
            "them"};
}

class BadEtcdTest : public ::testing::TestWithParam<BadEtcd> {};

TEST_P(BadEtcdTest, IsRefusedWithAClearText) {
    EXPECT_EQ(thrownText<UsageError>([] {
                  parseOptions({"--etcd", GetParam().text});
              }),
              GetParam().message);
}

INSTANTIATE_TEST_SUITE_P(
    Options, BadEtcdTest,
    ::testing::Values(
        noUrl("Nothing", ""), noUrl("NoScheme", "localhost:2379"),
        noUrl("OtherScheme", "ftp://a:1"), noUrl("NoUrl", "prefix=/p/"),
        noUrl("NoUrlButAPassword", "password=s3cret"),
        userInUrl("UserInUrl", "http://u:s3cret@a:1"),
        userInUrl("PasswordWithCommas", "http://u:s3,c,ret@a:1"),
        userInUrl("UserInASecondUrl", url + ",https://u@a:1"),
        userInUrl("UserInNoUrl", "u:s3cret@a:1"), userInUrl("UserInUnknown", url + ",a=u@b"),
        badSetting("Unknown", "ordre=5", "unknown setting: ordre (see --help)"),
        badSetting("UnknownPassword", "password=s3cret", "unknown setting: password (see --help)"),
        badSetting("UrlWithoutScheme", "b:2379", "unknown setting: b:2379 (see --help)"),
        badSetting("EmptyPart", "", "unknown setting:  (see --help)"),
        badSetting("Twice", "prefix=a,prefix=a", "prefix is given twice"),
        badSetting("WordTwice", "writable,order=1,writable", "writable is given twice"),
        badSetting("WordWithValue", "writable=yes", "writable takes no value"),
        badSetting("WordWithEmptyValue", "compare-and-swap=", "compare-and-swap takes no value"),
        badSetting("PrefixWithoutValue", "prefix", "prefix=P is needed"),
        badSetting("EmptyName", "name=", "name=NAME is needed"),
        badSetting("EmptyFile", "ca=", "ca=FILE is needed"),
        badSetting("NoOrder", "order", "order=N is needed"),
        badSetting("BadOrder", "order=5x", "the order is no number of 32 bits: 5x"),
        badSetting("GreatOrder", "order=2147483648",
                   "the order is no number of 32 bits: 2147483648"),
        badSetting("NegativeWait", "wait=-1s", "wait=-1s: less than no time"),
        badSetting("BadStart", "without-server=wait",
                   "without-server=wait: one of fail, last-known, empty is needed"),
        badSetting("LastKnownWithoutFile", "without-server=last-known",
                   "without-server=last-known needs last-known=FILE"),
        badSetting("UserWithoutPassword", "user=a", "user=NAME needs password-file=FILE"),
        badSetting("PasswordWithoutUser", "password-file=a", "password-file=FILE needs user=NAME"),
        badSetting("CaWithoutTls", "ca=a", "ca=FILE needs an https URL"),
        badSetting("CertWithoutTls", "cert=a,key=b", "cert=FILE needs an https URL"),
        BadEtcd{"CertWithoutKey", "https://a,cert=b", "--etcd https://a: cert=FILE needs key=FILE"},
        BadEtcd{"KeyWithoutCert", "https://a,key=b", "--etcd https://a: key=FILE needs cert=FILE"},
        badSetting("SwapWithoutWriting", "compare-and-swap", "compare-and-swap needs writable")),
    [](const auto& tested) { return std::string(tested.param.name); });

TEST(EtcdOption, RefusesAWaitThatIsNoTime) {
    const std::string text = thrownText<UsageError>([] {
        parseOptions({"--etcd", url + ",wait=5"});
    });
    EXPECT_EQ(text.rfind("--etcd " + url + ": wait=5: not ", 0), 0U) << text;
}

}  // namespace
}  // namespace velkor::host
