#include "settings/detail/Hub.hpp"

#include <map>
#include <utility>

#include "framework/reactive_streams/CallbackSubscriber.hpp"
#include "settings/detail/SettingState.hpp"

namespace velkor::settings::detail {

namespace {

using configuration::ConfigurationImpl;
using configuration::OptionChange;

/// The hubs of all stores. A store is known by its ownership, not by its address.
class Hubs {
public:
    std::shared_ptr<Hub> find(const std::weak_ptr<ConfigurationImpl>& store) {
        const common::MutexLock lock(mutex);
        const auto found = hubs.find(store);
        return found == hubs.end() ? nullptr : found->second.lock();
    }

    /// `made`, or the hub that another thread has entered meanwhile.
    std::shared_ptr<Hub> enter(const std::weak_ptr<ConfigurationImpl>& store,
                               const std::shared_ptr<Hub>& made) {
        const common::MutexLock lock(mutex);
        std::weak_ptr<Hub>& entry = hubs[store];
        auto known = entry.lock();
        if (known != nullptr) return known;
        entry = made;
        return made;
    }

    void forget(const std::weak_ptr<ConfigurationImpl>& store) {
        const common::MutexLock lock(mutex);
        const auto found = hubs.find(store);
        if (found != hubs.end() && found->second.expired()) hubs.erase(found);
    }

private:
    common::Mutex mutex;
    std::map<std::weak_ptr<ConfigurationImpl>, std::weak_ptr<Hub>, std::owner_less<>> hubs
        VELKOR_GUARDED_BY(mutex);
};

// Made on first use, since settings may be static objects of other libraries.
Hubs& hubs() {
    static Hubs instance;
    return instance;
}

// At the latest when the library is loaded, so that it goes behind settings that are made in main()
// and owned by a static object.
const Hubs& madeAtLoad = hubs();

}  // namespace

std::shared_ptr<Hub> Hub::find(const std::shared_ptr<ConfigurationImpl>& store) {
    return hubs().find(store);
}

std::shared_ptr<Hub> Hub::of(const std::shared_ptr<ConfigurationImpl>& store) {
    auto known = find(store);
    if (known != nullptr) return known;
    // It watches before others can find it. The store is not called under the mutex of `Hubs`, so
    // two threads may make one each; one of them goes again.
    const auto made = std::make_shared<Hub>(store);
    made->watch(0);
    return hubs().enter(store, made);
}

Hub::Hub(const std::shared_ptr<ConfigurationImpl>& followed) : store(followed) {}

Hub::~Hub() {
    hubs().forget(store);
}

void Hub::watch(std::uint64_t attempt) {
    const auto alive = store.lock();
    if (alive == nullptr) return;
    const auto stream = alive->watchChanges("");
    // What changes meanwhile is kept in the stream, so that nobody else delivers.
    if (attempt > 0) {
        for (const auto& state : index->all()) state->refresh();
    }
    reactive_streams::Callbacks<OptionChange> callbacks;
    callbacks.onValue = [index = index](OptionChange&& change) { index->pass(change); };
    // A source has thrown instead of giving its value: whatever can be read is read again.
    callbacks.onError = [self = weak_from_this(), attempt](const std::exception_ptr&) {
        if (const auto hub = self.lock()) hub->watch(attempt + 1);
    };
    auto opened = reactive_streams::subscribe(*stream, std::move(callbacks));
    const common::MutexLock lock(mutex);  // given back before the handle that is replaced ends
    if (attempt < newest) return;
    newest = attempt;
    std::swap(handle, opened);
}

}  // namespace velkor::settings::detail
