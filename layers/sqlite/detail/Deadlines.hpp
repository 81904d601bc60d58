#pragma once

#include <map>
#include <optional>
#include <string>
#include <vector>

#include "layers/sqlite/detail/Time.hpp"

namespace velkor::layers::detail {

/// When the values of which keys go. Not thread-safe.
class Deadlines {
public:
    using Map = std::map<std::string, Time>;

    explicit Deadlines(Map&& initial);

    /// Puts the one element of `entry`, or nothing when it is empty, in the place of what there is
    /// for `key`, and gives that. Takes no memory.
    std::optional<Time> replace(const std::string& key, Map&& entry) noexcept;

    /// Makes `time` that of `key`, or drops it. Throws `std::bad_alloc` and changes nothing then.
    void put(const std::string& key, std::optional<Time> time);

    /// A time before which nothing goes; nothing when nothing will ever go.
    std::optional<Time> next() const noexcept;

    /// The keys whose values are to go at `now`. What is left of them becomes due again.
    std::vector<std::string> due(Time now);

private:
    void findEarliest() noexcept;

    Map times;
    Time earliest = Time::max();  // none of them is earlier
};

}  // namespace velkor::layers::detail
