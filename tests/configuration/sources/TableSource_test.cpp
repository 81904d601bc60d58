#include "configuration/sources/TableSource.hpp"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <functional>
#include <memory>
#include <set>
#include <stdexcept>
#include <string>
#include <utility>

#include "configuration/ConfigurationImpl.hpp"
#include "configuration/sources/InMemorySource.hpp"
#include "configuration/sources/PropertyFileSource.hpp"
#include "tests/support/TemporaryFile.hpp"
#include "tests/support/ValueText.hpp"

namespace velkor::configuration {
namespace {

using ::testing::ElementsAre;
using testing::textOf;

/// A source of another library: answers from the table, can't be written, can forget.
class ForgettingSource : public TableSource {
public:
    explicit ForgettingSource(ValueMap&& initialValues)
        : TableSource(typeid(ForgettingSource), std::move(initialValues)) {}

    ConfigurationValue set(const std::string&, ConfigurationValue) override {
        throw std::runtime_error("can't be written");
    }

    bool forget(const std::string& key) {
        const bool known = values.take(key).has_value();
        if (known) notify(key);
        return known;
    }
};

/// One that derives from it and answers differently.
class NegatingSource : public ForgettingSource {
public:
    using ForgettingSource::ForgettingSource;

    ConfigurationValue get(const std::string& key) override {
        return -boost::get<int>(ForgettingSource::get(key));
    }
};

TEST(TableSource, AnswersFromItsTable) {
    ForgettingSource source({{"a", 1}, {"b", 2}});
    EXPECT_TRUE(source.has("a"));
    EXPECT_FALSE(source.has("c"));
    EXPECT_EQ(textOf(source.get("b")), "int 2");
    EXPECT_THAT(source.keys(), ElementsAre("a", "b"));
}

TEST(TableSource, MissingKeyThrowsFromGet) {
    ForgettingSource source({});
    try {
        source.get("a");
        FAIL() << "not refused";
    } catch (const std::out_of_range& error) {
        EXPECT_STREQ(error.what(), "_Map_base::at");
    }
}

TEST(TableSource, ForgottenKeyIsGone) {
    ForgettingSource source({{"a", 1}, {"b", 2}});
    EXPECT_TRUE(source.forget("a"));
    EXPECT_FALSE(source.forget("a"));
    EXPECT_FALSE(source.has("a"));
    EXPECT_THAT(source.keys(), ElementsAre("b"));
}

TEST(TableSource, ListenerIsToldUntilItIsDetached) {
    ForgettingSource source({{"a", 1}, {"b", 2}});
    std::string told;
    source.setChangeListener([&](const std::string& key) { told += key; });
    source.forget("a");
    source.setChangeListener({});
    source.forget("b");
    EXPECT_EQ(told, "a");
}

TEST(TableSource, TableIsThatOfExactlyTheNamedClass) {
    const testing::TemporaryFile file("k=v\n");
    EXPECT_NE(ForgettingSource(ValueMap()).table(), nullptr);
    EXPECT_EQ(NegatingSource(ValueMap()).table(), nullptr);
    EXPECT_NE(InMemorySource(ValueMap()).table(), nullptr);
    EXPECT_NE(PropertyFileSource(file.widePath()).table(), nullptr);
}

TEST(TableSource, StoreReadsTheTableAndAsksADerivedClass) {
    const auto store = std::make_shared<ConfigurationImpl>();
    store->addSource("table", "", 5, true, std::make_shared<ForgettingSource>(ValueMap{{"a", 1}}));
    EXPECT_EQ(textOf(store->get("a").get()), "int 1");
    store->addSource("negated", "", 4, true, std::make_shared<NegatingSource>(ValueMap{{"a", 1}}));
    EXPECT_EQ(textOf(store->get("a").get()), "int -1");
}

/// One whose own code runs in `set` and `keys`.
class HookedTable : public TableSource {
public:
    explicit HookedTable(ValueMap&& initialValues)
        : TableSource(typeid(HookedTable), std::move(initialValues)) {}

    ConfigurationValue set(const std::string&, ConfigurationValue value) override {
        hook();
        return value;
    }

    std::set<std::string> keys() override {
        if (hook) hook();
        return TableSource::keys();
    }

    std::function<void()> hook;
};

class HookedTableTest : public ::testing::Test {
protected:
    // Lets the source give up the last reference to the store.
    ConfigurationImpl* dropStoreIn(std::shared_ptr<HookedTable>&& source) {
        ConfigurationImpl* const plain = store.get();
        source->hook = [this] {
            store.reset();
            aliveAfterwards = !alive.expired();
        };
        return plain;
    }

    std::shared_ptr<ConfigurationImpl> store = std::make_shared<ConfigurationImpl>();
    const std::weak_ptr<ConfigurationImpl> alive = store;
    bool aliveAfterwards = false;
};

TEST_F(HookedTableTest, MayDropTheStoreFromInsideSet) {
    auto source = std::make_shared<HookedTable>(ValueMap{{"a", 1}});
    store->addSource("table", "", -1, false, source);
    dropStoreIn(std::move(source))->set("a", 2);
    EXPECT_TRUE(aliveAfterwards);
    EXPECT_TRUE(alive.expired());
}

TEST_F(HookedTableTest, MayDropTheStoreFromInsideKeys) {
    auto source = std::make_shared<HookedTable>(ValueMap{{"a", 1}});
    store->addSource("table", "", -1, false, source);
    dropStoreIn(std::move(source))->keys();
    EXPECT_TRUE(aliveAfterwards);
    EXPECT_TRUE(alive.expired());
}

TEST(TableSource, StoreSeesThatAKeyIsForgotten) {
    const auto store = std::make_shared<ConfigurationImpl>();
    const auto source = std::make_shared<ForgettingSource>(ValueMap{{"a", 1}});
    store->addSource("table", "", 5, true, source);
    source->forget("a");
    EXPECT_FALSE(store->has("a").get());
}

}  // namespace
}  // namespace velkor::configuration
