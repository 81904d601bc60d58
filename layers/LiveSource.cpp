#include "layers/LiveSource.hpp"

#include <exception>
#include <stdexcept>
#include <thread>
#include <utility>

namespace velkor::layers {

using common::MutexLock;
using configuration::ChangeListener;
using configuration::ConfigurationValue;
using configuration::ValueTable;

namespace {

constexpr const char* registeredAlready = "A source that changes by itself is registered once.";

bool isAttached(std::uint64_t attachmentNumber) {
    return attachmentNumber % 2 == 1;
}

}  // namespace

// One call of the listener, which whoever replaces that waits for. All calls form a chain, guarded
// by the mutex of the source.
class LiveSource::Call {
public:
    explicit Call(LiveSource& source) : owner(source), thread(std::this_thread::get_id()) {
        const MutexLock lock(owner.mutex);
        listener = owner.listener;
        next = std::exchange(owner.calls, this);
    }

    ~Call() {
        const MutexLock lock(owner.mutex);
        Call** link = &owner.calls;
        while (*link != this) link = &(*link)->next;
        *link = next;
        owner.callEnded.notify_all();
    }

    Call(const Call&) = delete;
    Call& operator=(const Call&) = delete;

    explicit operator bool() const { return listener != nullptr; }

    void operator()(const std::string& key) const { (*listener)(key); }

    // The calling thread goes on without waiting for others: it isn't waited for either, since both
    // may replace the listener from inside it.
    static void leave(Call* chain) noexcept {
        for (Call* each = chain; each != nullptr; each = each->next) {
            if (each->thread == std::this_thread::get_id()) each->hasLeft = true;
        }
    }

    static bool isRunning(const Call* chain, const ListenerPtr& called) noexcept {
        for (; chain != nullptr; chain = chain->next) {
            if (chain->listener == called && !chain->hasLeft) return true;
        }
        return false;
    }

private:
    LiveSource& owner;
    const std::thread::id thread;
    ListenerPtr listener;
    Call* next;
    bool hasLeft = false;
};

LiveSource::LiveSource(const std::type_info& answeringClass,
                       configuration::ValueMap&& initialValues, Code calledCode)
    : TableSource(answeringClass, std::move(initialValues), calledCode) {}

LiveSource::~LiveSource() = default;

ConfigurationValue LiveSource::get(const std::string& key) {
    const MutexLock lock(mutex);
    return TableSource::get(key);
}

bool LiveSource::has(const std::string& key) {
    const MutexLock lock(mutex);
    return TableSource::has(key);
}

std::set<std::string> LiveSource::keys() {
    const MutexLock lock(mutex);
    return TableSource::keys();
}

void LiveSource::setChangeListener(ChangeListener newListener) {
    ListenerPtr former;
    if (newListener) former = std::make_shared<const ChangeListener>(std::move(newListener));
    std::list<Keys> toTell;
    {
        MutexLock lock(mutex);
        listener.swap(former);
        if (listener != nullptr) toTell.swap(untold);
        if (former != nullptr) {
            Call::leave(calls);
            callEnded.notify_all();
            while (Call::isRunning(calls, former)) lock.wait(callEnded);
        }
    }
    for (const Keys& changed : toTell) tell(changed);
}

void LiveSource::attach(std::weak_ptr<configuration::SourceHost> newHost) {
    {
        const MutexLock lock(mutex);
        if (isAttached(attachmentNumber) && !host.expired()) {
            throw std::invalid_argument(registeredAlready);
        }
        host.swap(newHost);
        attachmentNumber += isAttached(attachmentNumber) ? 2U : 1U;
        untold.clear();
    }
    try {
        started();
    } catch (...) {
        detach();
        throw;
    }
}

void LiveSource::detach() noexcept {
    ListenerPtr dropped;
    {
        const MutexLock lock(mutex);
        if (!isAttached(attachmentNumber)) return;
        ++attachmentNumber;
        host.reset();
        untold.clear();
        dropped.swap(listener);
    }
    stopped();
}

void LiveSource::change(const std::function<Keys(ValueTable&)>& mutation) {
    bool done = false;
    while (!done) {
        const Attachment current = attachment();
        const auto attempt = [&] { done = tryChange(current, mutation); };
        if (current.host != nullptr) {
            current.host->changeTogether(attempt);
        } else {
            attempt();
        }
    }
}

LiveSource::Attachment LiveSource::attachment() const {
    const MutexLock lock(mutex);
    return {attachmentNumber, host.lock()};
}

// Gives false when the source was attached or removed meanwhile: another mutex is to be held then.
bool LiveSource::tryChange(const Attachment& expected,
                           const std::function<Keys(ValueTable&)>& mutation) {
    // Made before the change, after which nothing may fail that keeps it from being told.
    std::list<Keys> changed(1);
    {
        const MutexLock lock(mutex);
        if (attachmentNumber != expected.number) return false;
        changed.front() = mutation(values);
        const bool storeIsGoing = isAttached(attachmentNumber) && expected.host == nullptr;
        if (storeIsGoing) return true;
        if (listener == nullptr && isAttached(attachmentNumber)) {
            untold.splice(untold.end(), changed);
            return true;
        }
    }
    tell(changed.front());
    return true;
}

void LiveSource::tell(const Keys& changed) {
    std::exception_ptr failure;
    for (const auto& key : changed) {
        const Call listenerCall(*this);
        if (!listenerCall) break;
        try {
            listenerCall(key);
        } catch (...) {
            if (!failure) failure = std::current_exception();
        }
    }
    if (failure) std::rethrow_exception(failure);
}

}  // namespace velkor::layers
