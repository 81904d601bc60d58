#pragma once

#include <condition_variable>
#include <cstdint>
#include <functional>
#include <list>
#include <memory>
#include <set>
#include <string>
#include <typeinfo>
#include <vector>

#include "configuration/ConfigurationValue.hpp"
#include "configuration/sources/AttachedSource.hpp"
#include "configuration/sources/TableSource.hpp"
#include "framework/common/Export.hpp"
#include "framework/common/Mutex.hpp"

namespace velkor::layers {

/// Base of sources that change by themselves, on threads of their own: a table, and one safe way to
/// change it.
///
/// What a deriving source does:
/// - It changes its table through `change` only, whoever asks for it: its own thread, `set`,
/// `unset`.
///   The store and the direct readers then find all of a change or nothing of it, the listener is
///   called once for each changed key when its value can be read, and struct and value watchers are
///   told of all keys together, in the order in which the source took the values.
/// - It does no input or output and waits for nothing while `change` runs its function, nor in
///   `started` and `stopped`: the mutex of the store may be held. It prepares what is new before.
/// - It calls `change` with no lock of its own held that `set` or `unset` take.
/// - Its thread keeps the source alive for the time of a call of `change`, and for nothing longer:
///   by a shared pointer that it locks for it. That one may be the last, of the source or of the
///   store; both then end on that thread, which must not wait for itself, while the end of the
///   process waits for it (see `OwnThread` and its `Borrowing`).
///
/// What it is given:
/// - Changes of a registered source are made with the mutex of the store held and then this one's
///   own, in that order. The own mutex is never held while the listener is called.
/// - The listener is called only while the store is alive, which a reference ensures for the call.
///   Removal from the store and the end of the store take the listener away; a change afterwards
///   is made, and nobody told.
/// - What changed while the store was registering the source is told when its listener comes.
///
/// A source is registered in one store at a time, once. It may be removed and registered again.
class VELKOR_EXPORT LiveSource : public configuration::TableSource,
                                 public configuration::AttachedSource {
public:
    /// A copy of the value of `key`; `std::out_of_range` "_Map_base::at" when there is none. From
    /// any thread, as `has` and `keys`.
    configuration::ConfigurationValue get(const std::string& key) override;
    bool has(const std::string& key) override;
    std::set<std::string> keys() override;

    /// Replaces the listener; an empty one detaches. Returns when no call of the former listener
    /// runs on another thread, but for threads that wait here themselves. From any thread, also
    /// from inside the listener.
    void setChangeListener(configuration::ChangeListener newListener) override;

    /// Throws `std::invalid_argument` "A source that changes by itself is registered once." when it
    /// is registered already.
    void attach(std::weak_ptr<configuration::SourceHost> newHost) final;
    void detach() noexcept final;

protected:
    /// The keys that a change has changed.
    using Keys = std::vector<std::string>;

    /// Takes over `initialValues`, which is left empty. `answeringClass` is the `typeid` of the
    /// deriving class, whose `has` and `get` are those of this base.
    LiveSource(const std::type_info& answeringClass, configuration::ValueMap&& initialValues,
               Code calledCode = Code::foreign);
    ~LiveSource() override;

    /// Calls `mutation` once with the table, then the listener for each key that it gives. What
    /// `mutation` throws passes on, and nobody is told; it has to leave the table as it was. What
    /// the listener throws passes on as well, the first of it, when it has been called for all
    /// keys. From any thread, with or without the mutex of the store.
    void change(const std::function<Keys(configuration::ValueTable&)>& mutation);

    /// Called when a store is about to register the source, with the store's mutex held. What it
    /// throws leaves `addSource`, and the source is not registered.
    virtual void started() {}

    /// Called when the source has been removed from its store, or that has gone, with the store's
    /// mutex held.
    virtual void stopped() noexcept {}

private:
    class Call;

    using ListenerPtr = std::shared_ptr<const configuration::ChangeListener>;
    using HostPtr = std::shared_ptr<configuration::SourceHost>;

    // What is attached now: a number of its own for each attachment, odd while there is one.
    struct Attachment {
        std::uint64_t number;
        HostPtr host;  // null: there is none, or it is about to go
    };

    Attachment attachment() const VELKOR_EXCLUDES(mutex);
    bool tryChange(const Attachment& expected,
                   const std::function<Keys(configuration::ValueTable&)>& mutation)
        VELKOR_EXCLUDES(mutex);
    void tell(const Keys& changed) VELKOR_EXCLUDES(mutex);

    // Guards the table too, which the store reads with its own mutex held instead.
    mutable common::Mutex mutex;
    std::condition_variable callEnded;
    ListenerPtr listener VELKOR_GUARDED_BY(mutex);
    Call* calls VELKOR_GUARDED_BY(mutex) = nullptr;
    std::weak_ptr<configuration::SourceHost> host VELKOR_GUARDED_BY(mutex);
    std::uint64_t attachmentNumber VELKOR_GUARDED_BY(mutex) = 0;
    // What changed after the store had attached this and before it gave its listener.
    std::list<Keys> untold VELKOR_GUARDED_BY(mutex);
};

}  // namespace velkor::layers
