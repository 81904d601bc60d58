#pragma once

#include <algorithm>
#include <cstddef>
#include <memory>
#include <string_view>
#include <utility>

namespace velkor::http::detail::transport {

/// Bytes that were read and not yet understood.
class ReadBuffer {
public:
    std::string_view bytes() const noexcept { return {storage.get() + first, last - first}; }

    /// Forgets the first `count` bytes.
    void consume(std::size_t count) noexcept {
        first += count;
        if (first == last) first = last = 0;
    }

    /// Makes room behind the bytes, and says how much there is. May throw `std::bad_alloc`.
    std::size_t makeRoom() {
        constexpr std::size_t firstSize = 4096;
        if (first > 0) {
            std::copy(storage.get() + first, storage.get() + last, storage.get());
            last -= std::exchange(first, 0);
        }
        if (last == size) {
            const std::size_t newSize = size == 0 ? firstSize : size * 2;
            std::unique_ptr<char[]> bigger(new char[newSize]);
            std::copy(storage.get(), storage.get() + last, bigger.get());
            storage = std::move(bigger);
            size = newSize;
        }
        return size - last;
    }

    /// Where the room begins.
    char* room() noexcept { return storage.get() + last; }

    /// Adds the first `count` bytes of the room.
    void commit(std::size_t count) noexcept { last += count; }

private:
    std::unique_ptr<char[]> storage;
    std::size_t size = 0;
    std::size_t first = 0;
    std::size_t last = 0;
};

}  // namespace velkor::http::detail::transport
