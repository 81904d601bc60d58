#pragma once

#include <algorithm>
#include <chrono>
#include <cstddef>
#include <string>

#include "layers/sqlite/SqliteSource.hpp"
#include "tests/layers/faults/RandomValues.hpp"
#include "tests/layers/faults/StateModel.hpp"

namespace velkor::testing {

/// Makes random writes, the same ones in a source and in a model.
class RandomWrites {
public:
    /// How long values live that don't stay for good.
    static constexpr std::chrono::hours lifetime{1};

    /// Without a source they are made in the model only. Refers to all.
    RandomWrites(Random& generator, layers::SqliteSource* written, StateModel& expected)
        : random(generator), values(generator), source(written), model(expected) {}

    /// A write that needs nothing from the disk: sets a key, for good or not, or unsets one. Says
    /// whether there was something to do.
    bool write(HandClock::Time now) {
        const std::string key = values.key();
        const std::size_t kind = below(8, random);
        if (kind == 0) {
            if (source != nullptr) source->unset(key);
            return model.unset(key);
        }
        const auto value = values.value();
        if (kind == 1) {
            if (source != nullptr) source->setFor(key, value, lifetime);
            model.set(key, value, now + lifetime);
        } else {
            if (source != nullptr) source->set(key, value);
            model.set(key, value);
        }
        return true;
    }

    /// Undoes one of the last changes, if there is one. Throws what `SqliteSource::undo` does.
    void undo() {
        if (model.size() == 0) return;
        const std::size_t lately = std::min<std::size_t>(model.size(), 5);
        const std::size_t place = model.size() - 1 - below(lately, random);
        if (source != nullptr) source->undo(model.change(place));
        model.undo(place);
    }

    /// A few of both.
    void writeSome(HandClock::Time now) {
        if (below(4, random) == 0) undo();
        for (std::size_t count = below(5, random); count > 0; --count) write(now);
    }

private:
    Random& random;
    RandomValues values;
    layers::SqliteSource* const source;
    StateModel& model;
};

}  // namespace velkor::testing
