#pragma once

#include <memory>
#include <string>
#include <vector>

#include "host/SessionStore.hpp"

namespace velkor::host {

/// What `putValue` takes.
inline constexpr const char* putUsage =
    "KEY [VALUE...] [--type T] [--source SOURCE] [--for TIME] [--dry-run]";

/// Stores a value: with --type what `typedValue` makes of the VALUEs, else of the one VALUE its
/// text, if it is quoted, and what `wordValue` makes of it, if not. `arguments` are words as they
/// were typed, see `OptionWords`. Stores it where `set` would, or in SOURCE; with --for in the
/// layer that lasts, until the time is over. TIME is a number with a unit, as
/// `settings::Conversion` reads durations, between 1 ms and 36500 days. Gives nothing.
///
/// With --dry-run it stores nothing, and gives a table of what the layer holds, what is effective,
/// and what both would be. Values of secret keys are ••• there.
///
/// Throws `CommandError` as `OptionWords` and `typedValue` do; "put takes " and the usage for no
/// VALUE, or several without --type; "--for TIME: " and the reason for a TIME that is none; "--for
/// stores in the layer that lasts, and not in " SOURCE; and for a session in which nothing lasts
/// what `stateOf` throws. What the store refuses passes on. Nothing is stored then.
std::string putValue(const std::shared_ptr<SessionStore>& store,
                     const std::vector<std::string>& arguments);

}  // namespace velkor::host
