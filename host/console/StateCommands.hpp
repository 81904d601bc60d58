#pragma once

#include <memory>
#include <string>
#include <vector>

#include "host/SessionStore.hpp"

namespace velkor::host {

// The commands on what is set in a session. They show values of secret keys, see
// `settings::secretKeys`, as •••.

/// The layer that lasts. Throws `CommandError` "Nothing lasts in this session; start it with
/// --state FILE for that." when there is none.
StateLayer& stateOf(const SessionStore& store);

/// What `unsetKey` takes.
inline constexpr const char* unsetUsage = "KEY [--source SOURCE]";

/// Takes the key out of SOURCE, or the source that `set` would write it to, and gives what is
/// effective then: "KEY = VALUE (SOURCE)" or "No configuration option with key: KEY". `arguments`
/// are words as they were typed, see `OptionWords`. Throws `CommandError` "Nothing to unset: " with
/// that text when the key was not there, and as `OptionWords`; what the store refuses passes on.
std::string unsetKey(const std::shared_ptr<SessionStore>& store,
                     const std::vector<std::string>& arguments);

/// What `showHistory` takes.
inline constexpr const char* historyUsage = "[KEY] [--limit N]";

/// A table of the newest changes of the layer that lasts, the newest first, of KEY, of all keys
/// that KEY with a "." at its end begins, or of all; at most N, or 20. `arguments` are words as
/// they were typed, see `OptionWords`. Throws `CommandError` "--limit N: a number from 1 on is
/// needed", and as `OptionWords` and `stateOf`.
std::string showHistory(const std::shared_ptr<SessionStore>& store,
                        const std::vector<std::string>& arguments);

/// [N]: takes back the change with the number N, or the newest one, and gives the row of the
/// history that this makes. Throws `CommandError` "N is no number of a change: " and the text, and
/// as `showHistory`; what the layer refuses passes on.
std::string undoChange(const std::shared_ptr<SessionStore>& store,
                       const std::vector<std::string>& arguments);

}  // namespace velkor::host
