#pragma once

#include <functional>
#include <memory>

#include "framework/common/Export.hpp"

namespace velkor::configuration {

/// What a store offers to the sources that it tells of their registration.
class VELKOR_EXPORT SourceHost {
public:
    virtual ~SourceHost() = 0;

    /// Runs `change` with the mutex of the store held, and tells the watchers of all keys that are
    /// reported to the store meanwhile together afterwards, with this level of the mutex released.
    /// Whoever reads the store finds all of the change or nothing of it. What `change` throws
    /// passes on, when the watchers of what was reported before have been told.
    ///
    /// Not called with a lock held that the source takes when the store asks it.
    virtual void changeTogether(const std::function<void()>& change) = 0;
};

/// What a `ConfigurationSource` implements beside it to know the store that it is registered in:
/// one that changes on threads of its own.
class VELKOR_EXPORT AttachedSource {
public:
    virtual ~AttachedSource() = 0;

    /// Called before the source is registered, with the mutex of the store held. `host` is the
    /// store; it can't be locked any more when the store goes. What this throws leaves `addSource`,
    /// and nothing is registered.
    virtual void attach(std::weak_ptr<SourceHost> host) = 0;

    /// Called when the source has been removed, and by the store's destructor, with the mutex of
    /// the store held: it waits for nothing. From now on the source calls no listener of the store.
    virtual void detach() noexcept = 0;
};

}  // namespace velkor::configuration
