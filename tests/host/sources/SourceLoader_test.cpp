#include "host/sources/SourceLoader.hpp"

#include <gtest/gtest.h>

#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "host/console/ValueText.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::host {
namespace {

using velkor::testing::TemporaryFile;
using Words = std::vector<std::string>;

class SourceLoaderTest : public ::testing::Test {
protected:
    static SourceRequest file(const TemporaryFile& file) {
        return {std::nullopt, file.path().string()};
    }

    static SourceRequest source(const std::string& name, const TemporaryFile& file) {
        return {name, file.path().string()};
    }

    Words load(const std::vector<SourceRequest>& requests, const SourceLimits& limits = {}) {
        return loadSources(*store, requests, limits).failures;
    }

    Words sourceNames() {
        Words names;
        for (const auto& each : store->describeSources().get()) names.push_back(each.name);
        return names;
    }

    std::string value(const std::string& key) { return valueText(store->get(key).get()); }

    std::shared_ptr<configuration::ConfigurationImpl> store =
        std::make_shared<configuration::ConfigurationImpl>();
    const TemporaryFile base{"port=1\nhost=a\n", "base.properties"};
    const TemporaryFile site{"port=2\n", "site.properties"};
};

TEST_F(SourceLoaderTest, NamesASourceLikeItsFile) {
    EXPECT_EQ(load({file(base)}), Words{});
    EXPECT_EQ(sourceNames(), (Words{"override", "base", "default"}));
}

TEST_F(SourceLoaderTest, ALaterFileOverridesAnEarlierOne) {
    load({file(base), file(site)});
    EXPECT_EQ(value("port"), "'2'");
    EXPECT_EQ(value("host"), "'a'");
}

TEST_F(SourceLoaderTest, AWriteOverridesEveryFile) {
    load({file(base), file(site)});
    store->set("port", 3);
    EXPECT_EQ(value("port"), "3");
}

TEST_F(SourceLoaderTest, NumbersNamesThatAreTaken) {
    const TemporaryFile other("", "base.conf");
    const TemporaryFile reserved("", "default.properties");
    load({file(base), file(other), file(base), file(reserved)});
    EXPECT_EQ(sourceNames(),
              (Words{"override", "default-2", "base-3", "base-2", "base", "default"}));
}

TEST_F(SourceLoaderTest, NumbersNamesThatTheStoreHas) {
    store->addInMemorySource("base", "", 5, true, {});
    EXPECT_EQ(load({file(base)}), Words{});
    EXPECT_EQ(sourceNames(), (Words{"override", "base", "base-2", "default"}));
}

TEST_F(SourceLoaderTest, LeavesGivenNamesToTheirSources) {
    EXPECT_EQ(load({file(base), source("base", site)}), Words{});
    EXPECT_EQ(sourceNames(), (Words{"override", "base", "base-2", "default"}));
}

TEST_F(SourceLoaderTest, ReportsANameGivenTwice) {
    EXPECT_EQ(load({source("a", base), source("a", site)}),
              Words{"Source with the requested name already exists: a"});
}

TEST_F(SourceLoaderTest, ReportsEveryFileThatCantBeOpenedAndLoadsTheOthers) {
    EXPECT_EQ(load({{std::nullopt, "/no/\u00e9"}, file(base), {"n", "/no/b"}}),
              (Words{"Property file could not be opened: /no/\u00e9: No such file or directory",
                     "Property file could not be opened: /no/b: No such file or directory"}));
    EXPECT_EQ(sourceNames(), (Words{"override", "base", "default"}));
}

TEST_F(SourceLoaderTest, ReportsAFileAboveTheLimitAndLoadsTheOthers) {
    EXPECT_EQ(load({{std::nullopt, "/dev/zero"}, file(base)}, {1000}),
              Words{"Property file is larger than 1000 bytes: /dev/zero"});
    EXPECT_EQ(sourceNames(), (Words{"override", "base", "default"}));
}

TEST_F(SourceLoaderTest, ReportsAKindThatThereIsNot) {
    SourceRequest request = source("n", base);
    request.kind = "web";
    EXPECT_EQ(load({request}), Words{"Unknown kind of source: web"});
}

TEST_F(SourceLoaderTest, TakesOverGroupOrderAndAccess) {
    load({{"n", base.path().string(), "server", -3, true}});
    const auto description = store->describeSources().get().front();
    EXPECT_EQ(description.name, "n");
    EXPECT_EQ(description.group, "server.");
    EXPECT_EQ(description.order, -3);
    EXPECT_FALSE(description.readOnly);
    EXPECT_EQ(value("server.port"), "'1'");
}

}  // namespace
}  // namespace velkor::host
