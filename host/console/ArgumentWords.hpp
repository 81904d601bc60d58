#pragma once

#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "host/SessionStore.hpp"
#include "host/console/Watches.hpp"
#include "host/sources/SessionSources.hpp"

namespace velkor::host {

/// The words that arguments of commands may be, by the names that help shows of them.
class ArgumentWords {
public:
    /// For the state of a session as it is whenever it is asked for. No argument is null.
    ArgumentWords(std::shared_ptr<SessionStore> store, std::shared_ptr<const Watches> watches,
                  std::shared_ptr<const SessionSources> sources);

    /// What an argument called `name` may be that begins with `typed`, and perhaps more:
    ///
    /// - KEY, KEY-PREFIX, PATTERN: the keys of the store
    /// - WATCHED-KEY: the keys that are watched
    /// - SOURCE, A, B: the sources
    /// - T: the types of values
    /// - FILE: the files and folders, which end in "/", of the folder that `typed` names; hidden
    ///   ones only where their dot was typed
    /// - a|b: a and b
    ///
    /// Nothing for other names.
    std::vector<std::string> of(std::string_view name, const std::string& typed) const;

private:
    const std::shared_ptr<SessionStore> store;
    const std::shared_ptr<const Watches> watches;
    const std::shared_ptr<const SessionSources> sources;
};

}  // namespace velkor::host
