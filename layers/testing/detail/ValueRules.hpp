#pragma once

#include <gtest/gtest.h>

#include <cstddef>
#include <memory>
#include <set>
#include <string>

#include "configuration/sources/ForgettingSource.hpp"
#include "layers/testing/detail/SampleValues.hpp"
#include "layers/testing/detail/Trial.hpp"

// What a source answers. Each rule is a function of the same name as its test.
namespace velkor::layers::testing::detail {

/// Expects that `source` holds `expected` and nothing else, whichever way it is asked.
inline void expectToHold(ConfigurationSource& source, const ValueMap& expected) {
    std::set<std::string> keys;
    for (const auto& [key, value] : expected) {
        keys.insert(key);
        EXPECT_TRUE(source.has(key)) << key;
        EXPECT_TRUE(isSame(source.get(key), value)) << key;
    }
    EXPECT_EQ(source.keys(), keys);
    EXPECT_FALSE(source.has("contract.missing"));
}

inline void hasGetAndKeysAgree(const MakeSubject& makeSubject) {
    const SampleValues value(*makeSubject());
    expectToHold(*Trial(makeSubject(), {}).source(), {});

    const ValueMap two = {{"contract.first", value[0]}, {"contract.second", value[1]}};
    expectToHold(*Trial(makeSubject(), two).source(), two);

    for (const Way way : Trial(makeSubject(), {}).ways()) {
        SCOPED_TRACE(way);
        Trial trial(makeSubject(), two);
        const auto told = trial.listen();
        ASSERT_TRUE(trial.finish(way, "contract.first", value[2], *told));
        ASSERT_TRUE(trial.finish(way, "contract.third", value[3], *told));
        ValueMap expected = two;
        expected["contract.first"] = value[2];
        expected["contract.third"] = value[3];
        expectToHold(*trial.source(), expected);

        if (!trial.losesKeys(way)) continue;
        ASSERT_TRUE(trial.finish(way, "contract.second", {}, *told));
        expected.erase("contract.second");
        expectToHold(*trial.source(), expected);
    }
}

inline void everyKindIsKeptExactly(const MakeSubject& makeSubject) {
    const SampleValues value(*makeSubject());
    ValueMap all;
    for (std::size_t i = 0; i < value.size(); ++i) all["contract." + std::to_string(i)] = value[i];
    expectToHold(*Trial(makeSubject(), all).source(), all);

    for (const Way way : Trial(makeSubject(), {}).ways()) {
        SCOPED_TRACE(way);
        Trial trial(makeSubject(), {});
        const auto told = trial.listen();
        for (std::size_t i = 0; i < value.size(); ++i) {
            ASSERT_TRUE(trial.finish(way, "contract.key", value[i], *told)) << describe(value[i]);
            EXPECT_TRUE(isSame(trial.source()->get("contract.key"), value[i]));
        }
    }
}

inline void setGivesWhatItReplaces(const MakeSubject& makeSubject) {
    if (!makeSubject()->isWritable()) GTEST_SKIP() << "It can't be written.";
    const SampleValues value(*makeSubject());
    const Trial trial(makeSubject(), {{"contract.key", value[0]}});
    EXPECT_TRUE(isSame(trial.source()->set("contract.key", value[1]), value[0]));
    EXPECT_TRUE(isSame(trial.source()->set("contract.key", value[2]), value[1]));
}

inline void setOfANewKeyGivesTheValue(const MakeSubject& makeSubject) {
    if (!makeSubject()->isWritable()) GTEST_SKIP() << "It can't be written.";
    const SampleValues value(*makeSubject());
    const Trial trial(makeSubject(), {{"contract.key", value[0]}});
    EXPECT_TRUE(isSame(trial.source()->set("contract.new", value[1]), value[1]));
}

inline void whatCantBeWrittenRefuses(const MakeSubject& makeSubject) {
    if (makeSubject()->isWritable()) GTEST_SKIP() << "It can be written.";
    const SampleValues value(*makeSubject());
    Trial trial(makeSubject(), {{"contract.key", value[0]}});
    const auto told = trial.listen();
    EXPECT_ANY_THROW(trial.source()->set("contract.key", value[1]));
    EXPECT_ANY_THROW(trial.source()->set("contract.new", value[1]));
    expectToHold(*trial.source(), {{"contract.key", value[0]}});
    EXPECT_EQ(told->all(), std::vector<std::string>());
}

/// The source of `trial`, if keys that were written can be taken back from it; else null.
inline configuration::ForgettingSource* forgetting(const SourceSubject& subject,
                                                   const Trial& trial) {
    if (!subject.isWritable()) return nullptr;
    return dynamic_cast<configuration::ForgettingSource*>(trial.source().get());
}

inline void forgettingGivesTheValueAndTellsOnce(const MakeSubject& makeSubject) {
    const auto subject = makeSubject();
    const SampleValues value(*subject);
    Trial trial(subject, {{"contract.first", value[0]}, {"contract.second", value[1]}});
    auto* const source = forgetting(*subject, trial);
    if (source == nullptr) GTEST_SKIP() << "It can't forget.";

    const auto told = std::make_shared<Noted<std::string>>();
    trial.source()->setChangeListener([told, asked = trial.source().get()](const std::string& key) {
        told->note(key + (asked->has(key) ? " is still there" : " has gone"));
    });
    const auto removed = source->unset("contract.first");
    ASSERT_TRUE(removed.has_value());
    EXPECT_TRUE(isSame(*removed, value[0]));
    EXPECT_EQ(told->all(), std::vector<std::string>{"contract.first has gone"});
    expectToHold(*trial.source(), {{"contract.second", value[1]}});
}

inline void forgettingAMissingKeyTellsNobody(const MakeSubject& makeSubject) {
    const auto subject = makeSubject();
    const SampleValues value(*subject);
    Trial trial(subject, {{"contract.key", value[0]}});
    auto* const source = forgetting(*subject, trial);
    if (source == nullptr) GTEST_SKIP() << "It can't forget.";

    const auto told = trial.listen();
    EXPECT_FALSE(source->unset("contract.missing").has_value());
    EXPECT_EQ(told->all(), std::vector<std::string>());
    expectToHold(*trial.source(), {{"contract.key", value[0]}});
}

}  // namespace velkor::layers::testing::detail
