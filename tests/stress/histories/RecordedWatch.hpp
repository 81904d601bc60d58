#pragma once

#include <exception>
#include <functional>
#include <limits>
#include <memory>
#include <mutex>
#include <string>
#include <utility>

#include "framework/reactive_streams/Subscriber.hpp"
#include "tests/stress/histories/StoreRecorder.hpp"

namespace velkor::testing {

/// A watch that notes what its subscriber is told.
class RecordedWatch {
public:
    static constexpr auto allThereWillBe = std::numeric_limits<std::uint64_t>::max();

    virtual ~RecordedWatch() = default;

    /// Asks for `more` values, and notes that before it does.
    void request(std::uint64_t more) {
        {
            const std::lock_guard<std::mutex> lock(mutex);
            const bool isAll = more > allThereWillBe - log.requested;
            log.requested = isAll ? allThereWillBe : log.requested + more;
        }
        if (const auto opened = subscription.lock()) opened->request(more);
    }

    /// Cancels, and notes when that has returned.
    void cancel() {
        if (const auto opened = subscription.lock()) opened->cancel();
        const std::uint64_t returned = recorder.tick();
        const std::lock_guard<std::mutex> lock(mutex);
        if (!log.cancelled) log.cancelled = returned;
    }

    WatchLog watchLog() const {
        const std::lock_guard<std::mutex> lock(mutex);
        return log;
    }

protected:
    RecordedWatch(StoreRecorder& notes, WatchLog begun) : recorder(notes), log(std::move(begun)) {}

    /// Notes a signal while it runs.
    template <class Inside>
    void signal(Signal told, Inside inside) {
        told.thread = StoreRecorder::thisThread();
        std::size_t index = 0;
        {
            const std::lock_guard<std::mutex> lock(mutex);
            told.begun = recorder.tick();
            index = log.signals.size();
            log.signals.push_back(std::move(told));
        }
        inside();
        const std::lock_guard<std::mutex> lock(mutex);
        log.signals[index].ended = recorder.tick();
    }

    StoreRecorder& recorder;
    std::weak_ptr<reactive_streams::Subscription> subscription;
    mutable std::mutex mutex;
    WatchLog log;  // guarded by mutex
};

/// The subscriber behind it, of values or of changes. While it is told of a key it runs `then`.
template <class T>
class RecordingWatcher final : public reactive_streams::Subscriber<T>, public RecordedWatch {
public:
    using reactive_streams::Subscriber<T>::onNext;
    using Then = std::function<void(const std::string& key)>;

    RecordingWatcher(StoreRecorder& notes, WatchLog begun, std::uint64_t askFor, Then whenTold)
        : RecordedWatch(notes, std::move(begun)), first(askFor), then(std::move(whenTold)) {}

    void onSubscribe(std::weak_ptr<reactive_streams::Subscription> opened) override {
        subscription = std::move(opened);
        signal({Signal::Kind::subscribed}, [] {});
        request(first);
    }

    void onNext(T&& value) override {
        Signal told = spelled(value);
        const std::string key = told.key;
        signal(std::move(told), [&] { then(key); });
    }

    void onComplete() override {
        signal({Signal::Kind::completed}, [] {});
    }

    void onError(const std::exception_ptr&) override {
        signal({Signal::Kind::failed}, [] {});
    }

private:
    Signal spelled(const configuration::ConfigurationValue& value) const {
        return {Signal::Kind::value, watchedKey, StoreSubject::textOf(value)};
    }

    Signal spelled(const configuration::OptionChange& change) const {
        return {Signal::Kind::value, change.key,
                change.option ? StoreSubject::textOf(*change.option)
                              : "No option with the specified key was found: " + change.key,
                change.version};
    }

    const std::string watchedKey = log.watched;
    const std::uint64_t first;
    const Then then;
};

}  // namespace velkor::testing
