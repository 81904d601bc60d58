#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "configuration/Changes.hpp"
#include "configuration/ConfigurationValue.hpp"
#include "fuzz/Choices.hpp"

namespace velkor::fuzz::store {

/// How an own source answers from now on.
enum class Mood { willing, refusesSet, failsAfterSet, refusesHas, refusesGet, refusesKeys };

/// One thing that is done to a store, or by what it calls. What a member means depends on the
/// operation; `readStep` has the list.
struct Step {
    char operation = 'k';
    std::string key{};
    std::string name{};
    std::string group{};
    configuration::ConfigurationValue value{};
    configuration::ValueMap values{};
    std::vector<configuration::Change> changes{};
    std::vector<std::string> keys{};
    int order = 0;
    std::size_t number = 0;
    std::uint64_t demand = 0;
    bool flag = false;
    bool throws = false;
    Mood mood = Mood::willing;
    std::shared_ptr<const Step> reaction{};  ///< What a callback does; null: nothing.
};

/// The number of own sources, which are there from the beginning and belong to no store at first.
constexpr std::size_t ownSources = 3;

/// The next step: a letter, and its arguments as digits.
///
///     g KEY, o KEY, h KEY, e KEY   get, getOption, has, explain
///     k, d, f KEY                  keys, describeSources, the keys from KEY on
///     n COUNT KEY...               read: several keys at one moment
///     s KEY VALUE                  set          S KEY VALUE NAME   set in the source NAME
///     u KEY                        unset        U KEY NAME         unset in the source NAME
///     a COUNT DRY CHANGE...        apply; a CHANGE is KEY KIND, and VALUE or NAME as it says
///     m NAME GROUP ORDER READONLY VALUES        adds a source in memory
///     p NAME GROUP ORDER READONLY VALUES        adds a property file
///     c NAME GROUP ORDER READONLY SOURCE        adds an own source, perhaps once more
///     r NAME                       removes a source
///     t SOURCE MOOD REACTION       how an own source answers, and what it does while it is set
///     i SOURCE KEY VALUE           an own source changes by itself
///     w KEY DEMAND THROWS HELD REACTION   watches; what the subscriber does for each value
///     W KEY DEMAND THROWS HELD REACTION   watches all changes of keys that KEY begins
///     b WATCH                      subscribes once more
///     q WATCH DEMAND, x WATCH      requests, cancels
///     v WATCH                      gives the publisher up
///     B, Q, X, V                   the same for a watch of changes
///     l MODE NUMBER REACTION       logs from now on: the sink throws (1) or acts (2) at a record
///     D                            gives the store up
///
/// A REACTION is a digit and, where that is odd, a step. Those of reactions have none themselves
/// beyond `depth`.
Step readStep(Choices& choices, int depth = 2);

}  // namespace velkor::fuzz::store
