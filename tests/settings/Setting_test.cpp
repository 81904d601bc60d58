#include "settings/Setting.hpp"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <chrono>
#include <cstdint>
#include <cstdlib>
#include <memory>
#include <optional>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "tests/configuration/StoreTesting.hpp"
#include "tests/support/HookedSource.hpp"
#include "tests/support/LogCapture.hpp"

namespace velkor::settings::testing {
namespace {

using namespace std::chrono_literals;
using configuration::ConfigurationImpl;
using ::testing::ElementsAre;
using ::testing::Optional;
using velkor::testing::HookedSource;
using velkor::testing::LogCapture;

class SettingTest : public velkor::testing::StoreTest {
protected:
    template <class T, class... Arguments>
    std::string refusalOf(Arguments&&... arguments) {
        try {
            const Setting<T> setting(store, std::forward<Arguments>(arguments)...);
        } catch (const SettingError& error) {
            return error.what();
        }
        return "";
    }
};

TEST_F(SettingTest, HasItsDefaultWithoutAValue) {
    const Setting<int> port(store, "server.port", 8080);
    EXPECT_EQ(port, 8080);
}

TEST_F(SettingTest, HasTheValueOfTheStore) {
    store->set("server.timeout", "1.5 s");
    const Setting<std::chrono::milliseconds> timeout(store, "server.timeout", 30s);
    EXPECT_EQ(timeout.get(), 1500ms);
}

TEST_F(SettingTest, FollowsTheStore) {
    const Setting<int> port(store, "server.port", 8080);
    store->set("server.port", 9090);
    EXPECT_EQ(port, 9090);
}

TEST_F(SettingTest, HasItsDefaultAgainWhenTheKeyIsUnset) {
    store->set("server.port", 9090);
    const Setting<int> port(store, "server.port", 8080);
    store->unset("server.port");
    EXPECT_EQ(port, 8080);
}

TEST_F(SettingTest, HasItsDefaultAgainWhenTheSourceIsRemovedWithItsGroup) {
    add("site", "server", 10, {{"port", 9090}});
    const Setting<int> port(store, "server.port", 8080);
    store->removeSource("site");
    EXPECT_EQ(port, 8080);
}

TEST_F(SettingTest, IsNotSetBackByAReadingThatAChangeHasOvertaken) {
    const auto source = std::make_shared<HookedSource>(HookedSource::Table{{"server.port", 1}});
    store->addSource("site", "", 10, true, source);
    source->whenGet = [this] { store->set("server.port", 2); };
    const Setting<int> port(store, "server.port");
    EXPECT_EQ(port, 2);
}

TEST_F(SettingTest, FollowsASourceThatIsAdded) {
    const Setting<int> port(store, "server.port", 8080);
    add("site", "server", 10, {{"port", 9090}});
    EXPECT_EQ(port, 9090);
}

TEST_F(SettingTest, SharesItsKeyWithOthers) {
    const Setting<int> number(store, "server.port", 1);
    const Setting<std::string> text(store, "server.port", "none");
    store->set("server.port", 9090);
    EXPECT_EQ(number, 9090);
    EXPECT_EQ(text.get(), "9090");
}

TEST_F(SettingTest, OfAnOptionalTypeIsNothingWithoutAValue) {
    const Setting<std::optional<int>> limit(store, "limit");
    EXPECT_EQ(limit.get(), std::nullopt);
    store->set("limit", 5);
    EXPECT_THAT(limit.get(), Optional(5));
}

enum class Level : std::uint8_t { low, high };

TEST_F(SettingTest, OfASmallTypeIsOneAtomic) {
    EXPECT_TRUE(detail::fitsAtomic<Level>);
    EXPECT_TRUE(detail::fitsAtomic<std::optional<int>>);
    EXPECT_TRUE(detail::fitsAtomic<std::chrono::nanoseconds>);
    EXPECT_FALSE(detail::fitsAtomic<std::string>);
    EXPECT_FALSE(detail::fitsAtomic<std::optional<double>>);
}

TEST_F(SettingTest, TakesABracedListAsDefault) {
    const Setting<std::vector<std::string>> peers(store, "peers", {"a", "b"});
    EXPECT_THAT(peers.get(), ElementsAre("a", "b"));
}

TEST_F(SettingTest, GivesASnapshotThatDoesNotChange) {
    store->set("server.name", "old");
    const Setting<std::string> name(store, "server.name");
    const auto snapshot = name.snapshot();
    store->set("server.name", "new");
    EXPECT_EQ(*snapshot, "old");
    EXPECT_EQ(*name.snapshot(), "new");
}

TEST_F(SettingTest, IsReadThroughAReader) {
    store->set("server.name", "old");
    const Setting<std::string> name(store, "server.name");
    Setting<std::string>::Reader reader(name);
    EXPECT_EQ(reader.get(), "old");
    store->set("server.name", "new");
    EXPECT_EQ(reader.get(), "new");
}

TEST_F(SettingTest, MayEndBeforeItsReader) {
    std::optional<Setting<std::string>> name(std::in_place, store, "server.name", "default");
    auto reader = name->reader();
    name.reset();
    EXPECT_EQ(reader.get(), "default");
}

#ifdef VELKOR_SETTINGS_CHECK_REFERENCES
TEST_F(SettingTest, ShowsAReferenceThatIsKeptWithAddressSanitizer) {
    const Setting<std::string> name(store, "server.name", "default");
    auto reader = name.reader();
    const std::string& kept = reader.get();
    reader.get();
    EXPECT_DEATH(static_cast<void>(kept == "default"), "heap-use-after-free");
}
#endif

TEST_F(SettingTest, NeedsAValueOrADefault) {
    EXPECT_EQ(refusalOf<std::string>("server.name"), "server.name: no value, and no default");
}

TEST_F(SettingTest, NamesWhatDoesNotFit) {
    store->set("server.port", "abc");
    EXPECT_EQ(refusalOf<int>("server.port", 8080),
              "server.port: 'abc' from source \"override\" is no int: not a whole number in plain "
              "digits");
}

TEST_F(SettingTest, NamesTheConstraintThatIsNotKept) {
    store->set("server.port", 70000);
    EXPECT_EQ(refusalOf<int>("server.port", 8080, between(1, 65535)),
              "server.port: 70000 from source \"override\" is no int: not between 1 and 65535");
}

TEST_F(SettingTest, DoesNotNameASecret) {
    store->set("password", "short");
    EXPECT_EQ(refusalOf<std::string>("password", secret(),
                                     matching("the word",
                                              [](const std::string& text) -> bool {
                                                  throw std::runtime_error(text);
                                              })),
              "password: ••• from source \"override\" is no text: the check has failed");
}

TEST_F(SettingTest, RefusesADefaultThatIsNotRight) {
    EXPECT_EQ(refusalOf<int>("server.port", 0, atLeast(1)),
              "server.port: the default 0 is not right: not at least 1");
}

TEST_F(SettingTest, RefusesToBeWithoutAStore) {
    store = nullptr;
    EXPECT_THROW(Setting<int>(store, "server.port", 1), std::invalid_argument);
}

TEST_F(SettingTest, TakesItsDefaultForABadValueWhereAsked) {
    store->set("server.port", "abc");
    const LogCapture log("velkor::settings");
    const Setting<int> port(store, "server.port", 8080, orDefault(), atLeast(1));
    EXPECT_EQ(port, 8080);
    EXPECT_EQ(port.status().source, "");
    EXPECT_TRUE(port.status().error.has_value());
    EXPECT_EQ(log.records().size(), 1U);
}

TEST_F(SettingTest, KeepsTheLastGoodValue) {
    store->set("server.port", 9090);
    const Setting<int> port(store, "server.port", 8080);
    store->set("server.port", "abc");
    EXPECT_EQ(port, 9090);
}

TEST_F(SettingTest, LogsABadValueOnceForEachChange) {
    const Setting<int> port(store, "server.port", 8080);
    const LogCapture log("velkor::settings");
    store->set("server.port", "abc");
    store->set("server.port", "def");
    ASSERT_EQ(log.records().size(), 2U);
    EXPECT_EQ(log.records()[0].severity, common::error);
    EXPECT_EQ(log.records()[0].message,
              "server.port: 'abc' from source \"override\" is no int: not a whole number in plain "
              "digits; the last good value stays");
}

TEST_F(SettingTest, KeepsTheLastGoodValueWhenTheKeyVanishesWithoutADefault) {
    store->set("server.port", 9090);
    const Setting<int> port(store, "server.port");
    const LogCapture log("velkor::settings");
    store->unset("server.port");
    EXPECT_EQ(port, 9090);
    EXPECT_THAT(port.status().error, Optional(std::string("server.port: no value, and no "
                                                          "default")));
    ASSERT_EQ(log.records().size(), 1U);
    EXPECT_EQ(log.records()[0].severity, common::warning);
}

TEST_F(SettingTest, TellsHowItStands) {
    const auto before = std::chrono::system_clock::now();
    const Setting<std::chrono::seconds> timeout(store, "timeout", 30s);
    store->set("timeout", "60s");
    const Status status = timeout.status();
    EXPECT_EQ(status.value, "1min");
    EXPECT_EQ(status.source, "override");
    EXPECT_GE(status.since, before);
    EXPECT_EQ(status.error, std::nullopt);
    EXPECT_FALSE(status.storeGone);
}

TEST_F(SettingTest, HidesASecretInItsStatus) {
    const Setting<std::string> password(store, "password", "verysecret", secret());
    EXPECT_EQ(password.status().value, "•••");
}

TEST_F(SettingTest, ForgetsItsErrorWithTheNextGoodValue) {
    const Setting<int> port(store, "server.port", 8080);
    store->set("server.port", "abc");
    store->set("server.port", 1);
    EXPECT_EQ(port.status().error, std::nullopt);
}

TEST_F(SettingTest, OutlivesTheStore) {
    store->set("server.port", 9090);
    const Setting<int> port(store, "server.port", 8080);
    store.reset();
    EXPECT_EQ(port, 9090);
    EXPECT_TRUE(port.status().storeGone);
}

TEST_F(SettingTest, DoesNotKeepTheStoreAlive) {
    const std::weak_ptr<ConfigurationImpl> alive = store;
    const Setting<int> port(store, "server.port", 8080);
    store.reset();
    EXPECT_TRUE(alive.expired());
}

TEST_F(SettingTest, TellsTheValueBeforeAndTheValueNow) {
    Setting<int> port(store, "server.port", 8080);
    std::vector<std::pair<int, int>> changes;
    const auto handle =
        port.onChange([&](int before, int now) { changes.emplace_back(before, now); });
    store->set("server.port", 1);
    store->set("server.port", 2);
    EXPECT_THAT(changes, ElementsAre(std::pair(8080, 1), std::pair(1, 2)));
}

TEST_F(SettingTest, DoesNotTellOfTheSameValue) {
    Setting<int> port(store, "server.port", 8080);
    int calls = 0;
    const auto handle = port.onChange([&](int, int) { ++calls; });
    store->set("server.port", 8080);
    EXPECT_EQ(calls, 0);
    EXPECT_EQ(port.status().source, "override");
}

TEST_F(SettingTest, TellsOfTextsByReference) {
    Setting<std::string> name(store, "name", "old");
    std::string told;
    const auto handle = name.onChange(
        [&](const std::string& before, const std::string& now) { told = before + ">" + now; });
    store->set("name", "new");
    EXPECT_EQ(told, "old>new");
}

TEST_F(SettingTest, TellsNoMoreWhenTheHandleIsGone) {
    Setting<int> port(store, "server.port", 8080);
    int calls = 0;
    {
        const auto handle = port.onChange([&](int, int) { ++calls; });
    }
    store->set("server.port", 1);
    EXPECT_EQ(calls, 0);
}

TEST_F(SettingTest, TellsAllThoughOneThrows) {
    Setting<int> port(store, "server.port", 8080);
    const LogCapture log("velkor::settings");
    const auto first = port.onChange([](int, int) { throw std::runtime_error("no"); });
    int now = 0;
    const auto second = port.onChange([&](int, int value) { now = value; });
    store->set("server.port", 1);
    EXPECT_EQ(now, 1);
    EXPECT_THAT(log.messages(), ElementsAre("server.port: a callback has failed: no"));
}

TEST_F(SettingTest, MayBeChangedInItsOwnCallback) {
    Setting<int> port(store, "server.port", 0);
    std::vector<int> seen;
    const auto handle = port.onChange([&](int, int now) {
        if (now < 3) store->set("server.port", now + 1);
        seen.push_back(now);
    });
    store->set("server.port", 1);
    EXPECT_THAT(seen, ElementsAre(1, 2, 3));
}

TEST_F(SettingTest, MayEndInItsOwnCallback) {
    std::optional<Setting<int>> port(std::in_place, store, "server.port", 0);
    int calls = 0;
    const auto first = port->onChange([&](int, int) {
        ++calls;
        port.reset();
    });
    const auto second = port->onChange([&](int, int) { ++calls; });
    store->set("server.port", 1);
    store->set("server.port", 2);
    EXPECT_EQ(calls, 1);
}

TEST_F(SettingTest, MayLoseItsHandleInItsOwnCallback) {
    Setting<int> port(store, "server.port", 0);
    ChangeHandle handle;
    int calls = 0;
    handle = port.onChange([&](int, int) {
        ++calls;
        handle.cancel();
    });
    store->set("server.port", 1);
    store->set("server.port", 2);
    EXPECT_EQ(calls, 1);
}

TEST_F(SettingTest, ReleasesWhatItsCallbacksOwn) {
    const auto owned = std::make_shared<int>();
    std::optional<Setting<int>> port(std::in_place, store, "server.port", 0);
    const auto handle = port->onChange([owned](int, int) {});
    port.reset();
    EXPECT_EQ(owned.use_count(), 1);
}

TEST_F(SettingTest, MayBeMadeInACallbackOfAnother) {
    Setting<int> port(store, "server.port", 0);
    std::optional<Setting<int>> other;
    const auto handle = port.onChange([&](int, int) { other.emplace(store, "server.port", 7); });
    store->set("server.port", 1);
    ASSERT_TRUE(other.has_value());
    EXPECT_EQ(*other, 1);
}

// What `main` makes and a static object owns ends behind all that is made on first use.
[[noreturn]] void endWithASettingOfAStaticObject() {
    static std::optional<Setting<int>> port;
    const auto store = std::make_shared<ConfigurationImpl>();
    port.emplace(store, "server.port", 1);
    std::exit(*port == 1 ? 0 : 1);
}

TEST(SettingDeathTest, MayBeOwnedByAStaticObject) {
    ::testing::FLAGS_gtest_death_test_style = "threadsafe";  // where no setting was made before
    EXPECT_EXIT(endWithASettingOfAStaticObject(), ::testing::ExitedWithCode(0), "");
}

TEST_F(SettingTest, StillFollowsWhenASourceHasThrown) {
    const auto source = addHooked("site", "", 1, {{"name", std::string("old")}});
    const Setting<std::string> name(store, "name");
    const Setting<int> port(store, "server.port", 1);
    const LogCapture log("velkor::settings");
    bool broken = true;
    source->whenGet = [&] {
        if (broken) throw std::runtime_error("unplugged");
    };
    EXPECT_THROW(source->set("name", std::string("new")), std::runtime_error);
    EXPECT_THAT(name.status().error, Optional(std::string("name: can't be read: unplugged")));
    broken = false;
    store->set("server.port", 2);
    source->set("name", std::string("newest"));
    EXPECT_EQ(port, 2);
    EXPECT_EQ(name.get(), "newest");
}

}  // namespace
}  // namespace velkor::settings::testing
