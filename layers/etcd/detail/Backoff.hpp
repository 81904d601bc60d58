#pragma once

#include <algorithm>
#include <chrono>
#include <random>

namespace velkor::layers::etcd {

/// Growing pauses, each shortened by up to half of it at random, so that many clients don't come
/// all at once.
class Backoff {
public:
    using Milliseconds = std::chrono::milliseconds;

    Backoff(Milliseconds first, Milliseconds last, unsigned seed = std::random_device()())
        : shortest(std::max(first, Milliseconds(1))),
          longest(std::max(shortest, last)),
          following(shortest),
          random(seed) {}

    /// The pause that is due now.
    Milliseconds next() {
        const Milliseconds whole = following;
        following = std::min(following * 2, longest);
        std::uniform_int_distribution<Milliseconds::rep> part(0, whole.count() / 2);
        return whole - Milliseconds(part(random));
    }

    /// The next pause is the first one again.
    void reset() { following = shortest; }

private:
    const Milliseconds shortest;
    const Milliseconds longest;
    Milliseconds following;
    std::minstd_rand random;
};

}  // namespace velkor::layers::etcd
