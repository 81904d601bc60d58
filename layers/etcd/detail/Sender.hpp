#pragma once

#include <chrono>
#include <cstdint>
#include <exception>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "layers/etcd/detail/Backoff.hpp"
#include "layers/etcd/detail/Core.hpp"
#include "layers/etcd/detail/Endpoint.hpp"
#include "layers/etcd/detail/Gateway.hpp"

namespace velkor::layers::etcd {

/// The thread that writes: sends one group of writes after the other, each in a transaction. What
/// was sent is never sent again, unless the member says that it hasn't been done: of a group that
/// isn't answered the keys are read until that succeeds, and the next group is sent then.
///
/// Each group is made on the condition that nobody has written its keys since they were seen. One
/// that comes late, after its answer was given up, can't undo a later write by that. Where another
/// has written, what is there is seen now, and the group is sent again, unless who wrote it asked
/// for a comparison.
class Sender {
public:
    explicit Sender(std::shared_ptr<Core> shared);

    /// Until the source ends.
    void run();

private:
    using Clock = std::chrono::steady_clock;

    void send(const Group& group);
    void sendUntil(const Group& group, Clock::time_point deadline);
    void onTaken(const Group& group, std::int64_t revision);
    void onRefused(const Group& group, const std::string& reason);
    void onUnknown(const Group& group, const std::string& reason);
    void settle(const Group& group);
    void connect(Clock::time_point deadline);
    void disconnect();
    std::vector<KeyChange> changesOf(const Group& group) const;

    const std::shared_ptr<Core> core;
    EndpointRound endpoints;
    Backoff backoff;
    std::optional<Gateway> gateway;
};

}  // namespace velkor::layers::etcd
