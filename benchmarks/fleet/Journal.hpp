#pragma once

#include <atomic>
#include <chrono>
#include <cstddef>
#include <cstdint>

namespace velkor::benchmarks {

/// The clock of all processes of this machine.
using FleetClock = std::chrono::steady_clock;

/// What a process has seen or done.
enum class What : std::uint8_t {
    shown,     ///< A setting was read and had this value.
    sent,      ///< A write has begun.
    taken,     ///< It was acknowledged.
    refused,   ///< It was not made.
    unknown,   ///< It is not known whether it was made.
    readBack,  ///< Right after a write that was taken its store had this other value.
};

struct Note {
    FleetClock::time_point time;
    int key;
    int value;
    What what;
};

/// The notes of one process, in memory that it shares with the process that forked it. The process
/// that writes may have several threads; the other reads when that one has ended.
class Journal {
public:
    explicit Journal(std::size_t mostNotes);
    ~Journal();

    Journal(const Journal&) = delete;
    Journal& operator=(const Journal&) = delete;

    /// Notes it with the time of now. What finds no room is counted only.
    void add(What what, int key, int value) noexcept;

    const Note* begin() const noexcept { return notes; }
    const Note* end() const noexcept;

    /// Whether notes are missing.
    bool hasOverflown() const noexcept;

private:
    using Count = std::atomic<std::size_t>;
    static_assert(Count::is_always_lock_free, "processes share it");

    std::size_t bytes() const noexcept;

    const std::size_t capacity;
    Count* count = nullptr;
    Note* notes = nullptr;
};

}  // namespace velkor::benchmarks
