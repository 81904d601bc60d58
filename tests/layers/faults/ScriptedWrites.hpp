#pragma once

#include <gtest/gtest.h>

#include <chrono>
#include <exception>
#include <string>

#include "layers/sqlite/SqliteSource.hpp"
#include "tests/layers/faults/StateModel.hpp"

namespace velkor::testing {

/// Writes of every kind, one after the other, any of which may be refused.
class ScriptedWrites {
public:
    /// They are made in `source`; those that are acknowledged are noted in `expected`.
    ScriptedWrites(layers::SqliteSource& written, StateModel& expected)
        : source(written), model(expected) {}

    /// Makes all. After each one the source holds what was acknowledged and nothing else.
    void make(HandClock::Time now) {
        constexpr std::chrono::hours lifetime{1};
        set("server.port", 1);
        set("server.port", 2);
        set("text", std::string(9'000, 'x'));
        attempt([&] { source.unset("server.port"); }, [&] { model.unset("server.port"); });
        undo();
        attempt([&] { source.setFor("temporary", true, lifetime); },
                [&] { model.set("temporary", true, now + lifetime); });
        attempt([&] { source.unset("text"); }, [&] { model.unset("text"); });
        undo();
    }

    void set(const std::string& key, const configuration::ConfigurationValue& value) {
        attempt([&] { source.set(key, value); }, [&] { model.set(key, value); });
    }

private:
    void undo() {
        attempt([&] { source.undo(); }, [&] { model.undo(model.size() - 1); });
    }

    template <class Write, class Note>
    void attempt(Write write, Note note) {
        try {
            write();
            source.committed().get();
            note();
        } catch (const std::exception&) {
        }
        EXPECT_EQ(valuesOf(source), model.values());
    }

    layers::SqliteSource& source;
    StateModel& model;
};

}  // namespace velkor::testing
