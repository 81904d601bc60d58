#pragma once

#include <algorithm>
#include <chrono>
#include <functional>
#include <string>
#include <utility>
#include <vector>

#include "configuration/sources/ValueTable.hpp"
#include "framework/common/DiagnosticLogger.hpp"
#include "layers/etcd/EtcdOptions.hpp"
#include "layers/etcd/Loggers.hpp"
#include "layers/etcd/detail/Endpoint.hpp"
#include "layers/etcd/detail/Outbox.hpp"
#include "layers/etcd/detail/Replica.hpp"
#include "layers/etcd/detail/Standing.hpp"
#include "layers/etcd/detail/Stop.hpp"

namespace velkor::layers::etcd {

/// What a source and its two threads share. Lives as long as one of them.
struct Core {
    using Mutation = std::function<Replica::Keys(configuration::ValueTable&)>;

    /// Changes the table of the source as `LiveSource::change` does; false when the source has
    /// gone.
    using ChangeTable = std::function<bool(const Mutation&)>;

    Core(std::vector<Endpoint>&& where, std::string keyPrefix, EtcdOptions&& how)
        : endpoints(std::move(where)), prefix(std::move(keyPrefix)), options(std::move(how)) {
        options.silence = std::max(options.silence, std::chrono::milliseconds(100));
    }

    /// Changes the table. What watchers throw is their affair and dropped. Throws what `mutation`
    /// throws, and `Stopped` when the source has gone.
    void change(const Mutation& mutation) const;

    const std::vector<Endpoint> endpoints;
    const std::string prefix;
    EtcdOptions options;  // constant from then on
    Stop stop;
    Outbox outbox;
    Standing standing;
    Replica replica;          // used by mutations alone, see `Replica`
    ChangeTable changeTable;  // set before the threads start
};

/// Writes a record of `parts` that is no matter of life and death: what a sink of the log throws is
/// dropped.
template <class... Parts>
void report(common::Severity severity, const Parts&... parts) noexcept {
    try {
        etcdLogger.write(severity, parts...);
    } catch (...) {
        return;
    }
}

}  // namespace velkor::layers::etcd
