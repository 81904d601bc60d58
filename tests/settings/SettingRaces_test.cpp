#include <gtest/gtest.h>

#include <atomic>
#include <memory>
#include <optional>
#include <string>
#include <thread>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "settings/Bound.hpp"
#include "settings/Describe.hpp"
#include "settings/Secrets.hpp"
#include "settings/Setting.hpp"
#include "settings/testing/Override.hpp"
#include "tests/stress/Race.hpp"

namespace velkor::settings::testing {
namespace {

using configuration::ConfigurationImpl;
using configuration::ConfigurationValue;
using velkor::testing::race;
using velkor::testing::stressRounds;

struct Pair {
    int first = 0;
    std::string second{};
};

class SettingRaces : public ::testing::Test {
protected:
    Fields<Pair> both() const {
        return fields(&Pair::first, "first", 0, &Pair::second, "second", "0");
    }

    const std::shared_ptr<ConfigurationImpl> store = std::make_shared<ConfigurationImpl>();
};

TEST_F(SettingRaces, NoReaderOfAStructSeesHalfOfAnApply) {
    const Bound<Pair> pair(store, "pair", both());
    const int reads = 10 * stressRounds();
    std::atomic<int> mixed{0};
    std::atomic<bool> done{false};
    std::thread writer([&] {
        for (int i = 0; !done; ++i) {
            store->apply({{"pair.first", ConfigurationValue(i)},
                          {"pair.second", ConfigurationValue(std::to_string(i))}});
        }
    });
    const auto read = [&] {
        auto reader = pair.reader();
        int last = 0;
        int changes = 0;
        for (int i = 0; i < reads || changes < 100; ++i) {
            const Pair& now = reader.get();
            if (std::to_string(now.first) != now.second) ++mixed;
            if (now.first != last) ++changes;
            last = now.first;
        }
    };
    std::thread other(read);
    read();
    other.join();
    done = true;
    writer.join();
    EXPECT_EQ(mixed, 0);
}

TEST_F(SettingRaces, EverySettingEqualsTheStoreInTheEnd) {
    const Setting<int> number(store, "site.number", 0);
    const Setting<std::string> text(store, "site.number", "0");
    const Bound<Pair> pair(store, "site", fields(&Pair::first, "number", 0));
    int round = 0;
    int value = 0;
    race([&] { ++round; },
         [&] {
             store->addInMemorySource("site", "site", 5, false, {{"number", -round}});
             store->removeSource("site");
             if (round % 3 == 0) {
                 store->addInMemorySource("site", "site", -1, true, {{"number", -round}});
             }
         },
         [&] {
             store->set("site.number", ++value);
             if (value % 2 == 0) store->unset("site.number");
         },
         [&] {
             const auto reading = store->read({"site.number"}).get();
             const auto& option = reading.options.front();
             const int truth = option ? boost::get<int>(option->value) : 0;
             ASSERT_EQ(number, truth);
             ASSERT_EQ(text.get(), std::to_string(truth));
             ASSERT_EQ(pair.snapshot()->first, truth);
             store->removeSource("site");
         });
}

TEST_F(SettingRaces, NoCallbackRunsOnceTheSettingIsDestroyed) {
    std::optional<Setting<int>> setting;
    ChangeHandle handle;
    std::atomic<bool> alive{false};
    std::atomic<int> late{0};
    int value = 0;
    race(
        [&] {
            setting.emplace(store, "key", 0);
            alive = true;
            handle = setting->onChange([&](int, int) {
                if (!alive) ++late;
            });
        },
        [&] {
            setting.reset();
            alive = false;
        },
        [&] { store->set("key", ++value); }, [] {});
    EXPECT_EQ(late, 0);
}

TEST_F(SettingRaces, NoCallbackRunsOnceItsHandleIsDestroyed) {
    Setting<int> setting(store, "key", 0);
    ChangeHandle handle;
    std::atomic<bool> alive{false};
    std::atomic<int> late{0};
    int value = 0;
    race(
        [&] {
            alive = true;
            handle = setting.onChange([&](int, int) {
                if (!alive) ++late;
            });
        },
        [&] {
            handle.cancel();
            alive = false;
        },
        [&] { store->set("key", ++value); }, [] {});
    EXPECT_EQ(late, 0);
}

TEST_F(SettingRaces, ASettingThatIsMadeBesideAChangeIsUpToDate) {
    std::optional<Setting<int>> setting;
    int value = 0;
    race([&] { setting.reset(); }, [&] { setting.emplace(store, "key", 0); },
         [&] { store->set("key", ++value); }, [&] { ASSERT_EQ(*setting, value); });
}

TEST_F(SettingRaces, AReaderOfAnOverriddenSettingSeesOneOfItsValues) {
    store->set("key", 1);
    const Setting<int> setting(store, "key", 0);
    const Setting<std::string> text(store, "key");
    int seen = 0;
    std::string read;
    std::string source;
    race([] {}, [&] { const Override overridden(store, "key", 2); },
         [&] {
             seen = setting;
             read = text.get();
             source = setting.status().source;
         },
         [&] {
             ASSERT_TRUE(seen == 1 || seen == 2) << seen;
             ASSERT_TRUE(read == "1" || read == "2") << read;
             ASSERT_TRUE(source == "override" || source.rfind("test override ", 0) == 0) << source;
             ASSERT_EQ(setting, 1);
         });
}

TEST_F(SettingRaces, WhoListsSettingsSeesTheOnesThatStay) {
    const Setting<int> stays(store, "key", 1, secret());
    std::vector<Description> listed;
    bool isHidden = false;
    race([] {}, [&] { const Setting<int> comesAndGoes(store, "key", 2); },
         [&] {
             listed = describe(store, "key");
             isHidden = isSecret(store, "key");
         },
         [&] {
             ASSERT_TRUE(listed.size() == 1 || listed.size() == 2) << listed.size();
             ASSERT_TRUE(isHidden);
         });
}

TEST_F(SettingRaces, TwoThreadsMakeTheFirstSettings) {
    std::optional<Setting<int>> one;
    std::optional<Setting<int>> other;
    int value = 0;
    race(
        [&] {
            one.reset();
            other.reset();
        },
        [&] { one.emplace(store, "key", 0); }, [&] { other.emplace(store, "key", 0); },
        [&] {
            store->set("key", ++value);
            ASSERT_EQ(*one, value);
            ASSERT_EQ(*other, value);
        });
}

}  // namespace
}  // namespace velkor::settings::testing
