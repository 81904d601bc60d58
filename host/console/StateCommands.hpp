#pragma once

#include <memory>
#include <string>
#include <vector>

#include "host/SessionStore.hpp"

namespace velkor::host {

// The commands on what is set in a session. They show values of secret keys, see
// `settings::secretKeys`, as •••.

/// KEY VALUE [--for TIME]: stores what `configuration::typedText` makes of VALUE where `set` would;
/// with --for in the layer that lasts, until the time is over. TIME is a number with a unit, as
/// `settings::Conversion` reads durations, between 1 ms and 36500 days. Gives nothing.
///
/// Throws `CommandError` "--for TIME: " and the reason for a TIME that is none, "What follows VALUE
/// is no --for TIME." for other arguments, and for a session in which nothing lasts the text of
/// `history`; what the store refuses passes on.
std::string putValue(const std::shared_ptr<SessionStore>& store,
                     const std::vector<std::string>& arguments);

/// KEY: takes the key out of the source that `set` would write it to, and gives what is effective
/// then: "KEY = VALUE (SOURCE)" or "No configuration option with key: KEY". Throws `CommandError`
/// "Nothing to unset: " with that text when the key was not there.
std::string unsetKey(const std::shared_ptr<SessionStore>& store,
                     const std::vector<std::string>& arguments);

/// [KEY] [--limit N]: a table of the newest changes of the layer that lasts, the newest first, of
/// KEY, of all keys that KEY with a "." at its end begins, or of all; at most N, or 20.
///
/// Throws `CommandError` "--limit N: a number from 1 on is needed", "What follows KEY is no --limit
/// N." and, when there is no such layer, "Nothing lasts in this session; start it with --state FILE
/// for that.".
std::string showHistory(const std::shared_ptr<SessionStore>& store,
                        const std::vector<std::string>& arguments);

/// [N]: takes back the change with the number N, or the newest one, and gives the row of the
/// history that this makes. Throws `CommandError` "N is no number of a change: " and the text, and
/// as `showHistory`; what the layer refuses passes on.
std::string undoChange(const std::shared_ptr<SessionStore>& store,
                       const std::vector<std::string>& arguments);

}  // namespace velkor::host
