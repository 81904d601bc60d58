#pragma once

#include <chrono>
#include <cstdint>
#include <exception>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "layers/etcd/detail/Answers.hpp"
#include "layers/etcd/detail/Backoff.hpp"
#include "layers/etcd/detail/Core.hpp"
#include "layers/etcd/detail/Endpoint.hpp"
#include "layers/etcd/detail/Gateway.hpp"
#include "layers/etcd/detail/Requests.hpp"

namespace velkor::layers::etcd {

/// The thread that writes: sends one group of writes after the other, each in a transaction. What
/// was sent is never sent again, unless the member says that it hasn't been done: of a group that
/// isn't answered the keys are read until that succeeds, and the next group is sent then, if it has
/// not waited too long.
///
/// Each group is made on the condition that nobody has written its keys since they were seen. One
/// that comes late, after its answer was given up, can't undo a later write by that, nor a removal
/// where the request can ask for that too (see `transactionRequest`) and the key was there. Where
/// another has written, what is there is seen now, and the group is sent again, unless who wrote it
/// asked for a comparison.
class Sender {
public:
    explicit Sender(std::shared_ptr<Core> shared);

    /// Until the source ends.
    void run();

private:
    using Clock = std::chrono::steady_clock;
    using Changes = std::vector<KeyChange>;

    /// What some keys were at one moment.
    struct Found {
        std::vector<KeyUpdate> updates;
        std::int64_t revision;
    };

    void send(const Group& group);
    void transact(const Group& group, Clock::time_point deadline);
    std::optional<TransactionAnswer> ask(const Group& group, const std::string& request,
                                         Clock::time_point deadline);
    void onTaken(const Group& group, std::int64_t revision);
    void onRefused(const Group& group, const std::string& reason);
    void onUnknown(const std::string& reason);
    void refuseOverdue(const std::string& problem);
    void settle(const Group& group);
    Found read(Changes::const_iterator begin, Changes::const_iterator end);
    void connect(Clock::time_point deadline);
    void disconnect();
    Changes changesOf(const Group& group) const;

    // What these note and say is of no weight: short of memory they do without.
    std::string saying(const std::exception& error) const noexcept;
    void noteError(const char* text, const std::string& reason) const noexcept;

    template <class Mutation>
    void changeUntilDone(const Mutation& mutation);
    template <class Mutation>
    void finish(std::exception_ptr outcome, const Mutation& mutation);

    const std::shared_ptr<Core> core;
    EndpointRound endpoints;
    Backoff backoff;
    std::optional<Gateway> gateway;
};

}  // namespace velkor::layers::etcd
