#pragma once

#include <cstddef>
#include <list>
#include <optional>
#include <thread>

#include "layers/sqlite/JournalEntry.hpp"
#include "layers/sqlite/detail/Deadlines.hpp"
#include "layers/sqlite/detail/Time.hpp"

namespace velkor::layers::detail {

/// A write that has been accepted: it stands in the table and is to get into the file.
struct Write {
    JournalEntry entry{};
    std::optional<Time> expires{};        ///< When the new value goes.
    std::optional<Time> expiredBefore{};  ///< When the replaced one would have gone.
    std::thread::id writer{};             ///< Who is to be told of a refusal; none: nobody.
    std::size_t weight = 0;               ///< About how many bytes it takes while it waits.
};

/// What `write` takes.
std::size_t weightOf(const Write& write);

/// Writes in the order in which they were accepted. A list, since its elements are made beforehand
/// and taken over without memory.
using Writes = std::list<Write>;

/// A write with all the memory that accepting it takes.
class PreparedWrite {
public:
    explicit PreparedWrite(Write&& write);

    Write& write() noexcept { return element.front(); }

    Writes element;           ///< The one write.
    Deadlines::Map deadline;  ///< Of its value, if that goes.
};

}  // namespace velkor::layers::detail
