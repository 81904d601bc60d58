#pragma once

#include <filesystem>
#include <memory>

#include "layers/sqlite/SqliteSource.hpp"
#include "tests/layers/faults/RandomWrites.hpp"

namespace velkor::testing {

/// The author of what the program writes that is to be killed.
inline constexpr const char* killedWriter = "killed writer";

/// Opens a state file as that program does.
inline std::shared_ptr<layers::SqliteSource> openForKilledWriter(
    const std::filesystem::path& file) {
    layers::SqliteOptions options;
    options.author = killedWriter;
    return layers::SqliteSource::open(file, options);
}

}  // namespace velkor::testing
