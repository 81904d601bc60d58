#pragma once

#include <atomic>
#include <cstddef>

namespace velkor::http::detail::transport {

/// Bytes that the large bodies, answers and events of all connections may take together.
/// Thread-safe.
class Budget {
public:
    /// One alone may be larger than `mostBytes`.
    explicit Budget(std::size_t mostBytes) noexcept : most(mostBytes) {}

    /// Whether there is some left.
    bool hasRoom() const noexcept { return taken < most; }

    /// What one connection takes of it, and gives back at its end. The budget outlives it.
    class Share {
    public:
        explicit Share(Budget& common) noexcept : budget(common) {}
        ~Share() { take(0); }

        Share(const Share&) = delete;
        Share& operator=(const Share&) = delete;

        /// Takes `bytes` instead of what it had; without room for more it changes nothing and says
        /// false. What is not large counts as nothing.
        bool tryTake(std::size_t bytes) noexcept {
            const std::size_t others = budget.taken - own;
            if (counted(bytes) > own && others > 0 && others + bytes > budget.most) return false;
            take(bytes);
            return true;
        }

        /// The same, whether there is room or not.
        void take(std::size_t bytes) noexcept {
            budget.taken += counted(bytes) - own;  // modulo its size: less is a large number
            own = counted(bytes);
        }

    private:
        static constexpr std::size_t largest = std::size_t{16} << 10U;  // of what is not large

        static std::size_t counted(std::size_t bytes) noexcept {
            return bytes > largest ? bytes : 0;
        }

        Budget& budget;
        std::size_t own = 0;
    };

private:
    const std::size_t most;
    std::atomic<std::size_t> taken{0};
};

}  // namespace velkor::http::detail::transport
