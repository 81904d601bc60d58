#include <gtest/gtest.h>

#include "tests/host/ChildProcess.hpp"

namespace velkor::host {
namespace {

// The program was built without the library.
TEST(WithoutEtcd, ALayerThereIsRefused) {
    const auto result = runProgram({"--etcd", "http://a:1,prefix=/p/", "-c", "get port"});
    EXPECT_EQ(result.exitCode, 3);
    EXPECT_EQ(result.err,
              "velkor-config: --etcd needs velkor::etcd, which this velkor-config was built "
              "without: http://a:1\n");
    EXPECT_EQ(result.out, "No configuration option with key: port\n");
}

}  // namespace
}  // namespace velkor::host
