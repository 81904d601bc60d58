#include "benchmarks/fleet/Journal.hpp"

#include <sys/mman.h>

#include <algorithm>
#include <new>

namespace velkor::benchmarks {

namespace {

// Before the notes there is their number, in a cache line of its own.
constexpr std::size_t lead = 64;

}  // namespace

Journal::Journal(std::size_t mostNotes) : capacity(mostNotes) {
    void* const memory =
        ::mmap(nullptr, bytes(), PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0);
    if (memory == MAP_FAILED) throw std::bad_alloc();
    count = new (memory) Count(0);
    notes = reinterpret_cast<Note*>(static_cast<char*>(memory) + lead);
}

Journal::~Journal() {
    ::munmap(count, bytes());
}

std::size_t Journal::bytes() const noexcept {
    return lead + capacity * sizeof(Note);
}

void Journal::add(What what, int key, int value) noexcept {
    const auto now = FleetClock::now();
    const std::size_t place = count->fetch_add(1);
    if (place < capacity) notes[place] = {now, key, value, what};
}

const Note* Journal::end() const noexcept {
    return notes + std::min(count->load(), capacity);
}

bool Journal::hasOverflown() const noexcept {
    return count->load() > capacity;
}

}  // namespace velkor::benchmarks
