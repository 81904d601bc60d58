#pragma once

#include <chrono>
#include <cstddef>

#include "layers/sqlite/SqliteSource.hpp"
#include "tests/layers/faults/RandomValues.hpp"
#include "tests/layers/faults/StateModel.hpp"

namespace velkor::testing {

/// Makes random writes, the same ones in a source and in a model.
class RandomWrites {
public:
    /// How long values live that don't stay for good.
    static constexpr std::chrono::hours lifetime{1};

    RandomWrites(Random& generator, StateModel& expected)
        : random(generator), values(generator), model(expected) {}

    /// A write that needs nothing from the disk: sets a key, for good or not, or unsets one. Says
    /// whether there was something to do.
    bool write(layers::SqliteSource& source, StateModel::Time now) {
        const std::string key = values.key();
        const std::size_t kind = below(8, random);
        if (kind == 0) {
            source.unset(key);
            return model.unset(key);
        }
        const auto value = values.value();
        if (kind == 1) {
            source.setFor(key, value, lifetime);
            model.set(key, value, now + lifetime);
        } else {
            source.set(key, value);
            model.set(key, value);
        }
        return true;
    }

    /// Undoes one of the last changes, if there is one. Throws what `SqliteSource::undo` does.
    void undo(layers::SqliteSource& source) {
        if (model.size() == 0) return;
        const std::size_t place =
            model.size() - 1 - below(std::min<std::size_t>(model.size(), 5), random);
        source.undo(model.change(place));
        model.undo(place);
    }

private:
    Random& random;
    RandomValues values;
    StateModel& model;
};

}  // namespace velkor::testing
