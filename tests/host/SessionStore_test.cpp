#include "host/SessionStore.hpp"

#include <gtest/gtest.h>

#include <csignal>
#include <memory>
#include <stdexcept>
#include <string>
#include <vector>

#include "configuration/admin/ConfigurationCommandProvider.hpp"
#include "host/console/CommandRegistry.hpp"
#include "host/console/Interruption.hpp"
#include "host/console/ValueText.hpp"
#include "tests/support/TemporaryFile.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::host {
namespace {

using velkor::testing::TemporaryFile;
using velkor::testing::thrownText;

class SessionStoreTest : public ::testing::Test {
protected:
    std::shared_ptr<SessionStore> store = std::make_shared<SessionStore>(SourceLimits{10});
};

TEST_F(SessionStoreTest, ReadsSmallFiles) {
    const TemporaryFile file("a=1\n");
    EXPECT_TRUE(store->addPropertyFileSource("n", "g", 5, true, file.widePath()).get());
    EXPECT_EQ(valueText(store->get("g.a").get()), "'1'");
}

TEST_F(SessionStoreTest, RefusesFilesAboveTheLimit) {
    EXPECT_EQ(thrownText<std::runtime_error>(
                  [this] { store->addPropertyFileSource("n", "", 5, true, u"/dev/zero"); }),
              "Property file is larger than 10 bytes: /dev/zero");
}

TEST_F(SessionStoreTest, EndsAListWhenItIsInterrupted) {
    const auto registry = std::make_shared<CommandRegistry>();
    const configuration::ConfigurationCommandProvider commands(store, registry);
    store->set("a", 1);
    const Interruption interruption;
    std::raise(SIGINT);
    EXPECT_THROW(registry->find("list")->run({}), Interrupted);
    Interruption::take();
    EXPECT_EQ(registry->find("list")->run({}), "a = 1\n");
}

}  // namespace
}  // namespace velkor::host
