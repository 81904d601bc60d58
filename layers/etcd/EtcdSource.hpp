#pragma once

#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "configuration/sources/DurableSource.hpp"
#include "configuration/sources/ForgettingSource.hpp"
#include "configuration/sources/GroupingSource.hpp"
#include "configuration/sources/MonitoredSource.hpp"
#include "framework/Future.hpp"
#include "framework/common/Export.hpp"
#include "layers/LiveSource.hpp"
#include "layers/OwnThread.hpp"
#include "layers/etcd/EtcdErrors.hpp"
#include "layers/etcd/EtcdOptions.hpp"

namespace velkor::layers {

namespace etcd {
struct Core;
}  // namespace etcd

/// A writable layer whose values live in etcd, for all processes that read the same prefix there.
/// The keys below the prefix are the configuration's, byte for byte; a value is a JSON object of
/// "type" and "value" as in messages, and any other bytes are a narrow text.
///
/// All values are read once, at one revision; then a stream of changes is followed. They stand in a
/// table: reading does no input or output. Each revision is one change of the table, in their
/// order, and watchers are told of its keys together. What the source can't reach it goes on
/// without: with the values that it has, reconnecting with growing pauses to one member after the
/// other. It resumes where it was, or reads all again and tells what differs. No key goes back in
/// revision, unless the server does that was restored from an older state.
///
/// A write can be read at once where it was written. A thread of the source sends it, and what
/// `apply` of the store changes together as one transaction. Whoever acknowledges a write waits for
/// `committed`: the server has it then. A write that the server refuses is taken back, and watchers
/// are told. One that isn't answered is of unknown outcome, and `committed` says so; the source
/// never sends it again, asks the server what it holds until it is answered, and shows that. Should
/// the server make it later all the same, it undoes no write that came meanwhile, and no removal
/// unless the key was new or one of more than 64 that were changed together. Writes are made one
/// after the other.
///
/// Two threads and, once something is written, two connections. Thread-safe. Nobody waits for
/// `committed` with the mutex of the store held or on a thread of the source, which includes all
/// subscribers: those threads could not go on.
///
/// When the last reference is given up, what the server has not taken is given up too, `committed`
/// says so, and the threads have ended when that returns, but for the one that it happens on. That
/// may wait for the system to look a host name up.
class VELKOR_EXPORT EtcdSource final : public LiveSource,
                                       public configuration::ForgettingSource,
                                       public configuration::DurableSource,
                                       public configuration::GroupingSource,
                                       public configuration::MonitoredSource {
    struct Key {};

public:
    /// Reads the values of all keys that `prefix` begins from one of the `endpoints`,
    /// "http://HOST:PORT" or "https://HOST:PORT" each, and follows them. Waits for that as long as
    /// `options` say.
    ///
    /// Throws `std::invalid_argument` "An etcd endpoint is needed." or "Not an etcd endpoint: " and
    /// the text; `std::runtime_error` "etcd could not be read: ", the endpoint that was asked last,
    /// ": " and the reason, and where the last known values were to be used instead, "; " and why
    /// they could not be.
    static std::shared_ptr<EtcdSource> open(const std::vector<std::string>& endpoints,
                                            const std::string& prefix, EtcdOptions options = {});

    /// For `open`.
    EtcdSource(Key, std::shared_ptr<etcd::Core> shared);
    ~EtcdSource() override;

    /// Stores `value` here, calls the listener, and returns the value that was replaced, or `value`
    /// when the key is new; the server gets it soon. What the listener throws passes on; the value
    /// is stored by then.
    ///
    /// Throws `std::runtime_error` "etcd refused the write: too many writes wait for the server"
    /// when 100,000 do, or 256 MiB. Nothing has changed then.
    configuration::ConfigurationValue set(const std::string& key,
                                          configuration::ConfigurationValue value) override;

    /// Removes `key`, calls the listener, and gives the removed value; nothing happens when there
    /// is none. Throws as `set`.
    std::optional<configuration::ConfigurationValue> unset(const std::string& key) override;

    /// Resolves with true when the server has taken all writes that were accepted before this call.
    /// Otherwise it fails with the reason of the first that it has not taken, also of those that
    /// this thread wrote since it last asked: `std::runtime_error` "etcd refused the write: " and
    /// why, "another has changed the key meanwhile" where `compareAndSwap` is asked for, "the write
    /// was not sent: " and why; or `UnknownOutcome` "etcd has not said whether it has written: "
    /// and why. Resolved on a thread of the source, with no mutex held; a continuation runs there.
    Future<bool> committed() override;

    /// What is written in between on one thread is one transaction. The server takes up to 128
    /// keys in one, unless it was told otherwise, and refuses more; with `compareAndSwap` a key
    /// that it has counts twice.
    void beginGroup() override;
    void endGroup() noexcept override;

    /// Well while a member tells the changes. Details are "endpoint", "revision" and, if any,
    /// "waiting writes".
    configuration::SourceState state() const override;

private:
    void start();
    void finish();
    static void requireRoom(const etcd::Core& core);

    const std::shared_ptr<etcd::Core> core;
    std::optional<OwnThread> reader;
    std::optional<OwnThread> writer;
};

}  // namespace velkor::layers
