#include "host/sources/SourceKinds.hpp"

#include <gtest/gtest.h>

#include <cstdlib>
#include <optional>
#include <stdexcept>
#include <string>

#include "tests/support/TemporaryFile.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::host {
namespace {

using velkor::testing::TemporaryFile;
using velkor::testing::thrownText;

SourceRequest requestFor(const std::string& location) {
    return {std::nullopt, location};
}

TEST(SourceKinds, FileIsTheKindOfARequestThatNamesNone) {
    EXPECT_EQ(requestFor("a").kind, sourceKind("file").name);
}

TEST(SourceKinds, FileMakesASourceOfThePropertiesThere) {
    const TemporaryFile file("a=1\n");
    EXPECT_TRUE(sourceKind("file").make(requestFor(file.path().string()), {}).source->has("a"));
}

TEST(SourceKinds, FileKeepsTheLimit) {
    const SourceLimits limits{10};
    EXPECT_THROW(sourceKind("file").make(requestFor("/dev/zero"), limits), std::runtime_error);
}

TEST(SourceKinds, FileIsCalledLikeItselfWithoutFolderAndLastExtension) {
    EXPECT_EQ(sourceKind("file").usualName(requestFor("/a/b.c.properties")), "b.c");
}

TEST(SourceKinds, EnvironmentMakesASourceOfTheVariablesWithAPrefix) {
    ::setenv("KINDS_TEST_A__B", "1", 1);
    const auto source = sourceKind("environment").make(requestFor("KINDS_TEST_"), {}).source;
    ::unsetenv("KINDS_TEST_A__B");
    EXPECT_TRUE(source->has("a.b"));
}

TEST(SourceKinds, EnvironmentIsCalledSo) {
    EXPECT_EQ(sourceKind("environment").usualName(requestFor("A_")), "environment");
}

TEST(SourceKinds, EtcdIsCalledSo) {
    EXPECT_EQ(sourceKind("etcd").usualName(requestFor("http://a")), "etcd");
}

TEST(SourceKinds, EtcdThatCanNotBeFollowedNamesTheEndpoint) {
    SourceRequest request = requestFor("http://a:b");
    request.etcd = EtcdRequest{{request.location}};
    const std::string text =
        thrownText<std::runtime_error>([&] { sourceKind("etcd").make(request, {}); });
    EXPECT_NE(text.find("http://a:b"), std::string::npos) << text;
}

TEST(SourceKinds, OthersAreRefused) {
    EXPECT_EQ(thrownText<std::invalid_argument>([] { sourceKind("fil"); }),
              "Unknown kind of source: fil");
}

}  // namespace
}  // namespace velkor::host
