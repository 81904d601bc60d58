// Streams: delivery to a subscriber that waits, and the life of a watch.

#include <boost/signals2/signal.hpp>
#include <functional>
#include <memory>
#include <mutex>
#include <string>
#include <utility>

#include "benchmarks/support/CountingSubscriber.hpp"
#include "benchmarks/support/Fixtures.hpp"
#include "benchmarks/support/Harness.hpp"
#include "framework/reactive_streams/CachedValuePublisher.hpp"
#include "framework/reactive_streams/CallbackSubscriber.hpp"

namespace velkor::benchmarks {

namespace {

using ValueSubscriber = reactive_streams::Subscriber<ConfigurationValue>;
using Publisher = reactive_streams::CachedValuePublisher<ConfigurationValue, std::function<void()>>;

// What handing a copy of a value to a function costs at least: a mutex and the call.
class FloorPublisher {
public:
    explicit FloorPublisher(std::shared_ptr<ValueSubscriber> receiver)
        : subscriber(std::move(receiver)) {}

    void publish(const ConfigurationValue& value) {
        ValueSubscriber* waiting = nullptr;
        {
            const std::lock_guard<std::mutex> lock(mutex);
            waiting = subscriber.get();
        }
        waiting->onNext(ConfigurationValue(value));
    }

private:
    std::mutex mutex;
    std::shared_ptr<ValueSubscriber> subscriber;
};

void measureDelivery(const std::string& kind, const ConfigurationValue& value) {
    measure("deliver/" + kind + "/floor", [value] {
        const auto subscriber = std::make_shared<CountingSubscriber>();
        return [publisher = std::make_shared<FloorPublisher>(subscriber), value] {
            publisher->publish(value);
        };
    });
    measure("deliver/" + kind + "/velkor", [value] {
        auto publisher = std::make_shared<Publisher>(1, [] {});
        publisher->subscribe(std::make_shared<CountingSubscriber>());
        return [publisher, value] { publisher->publish(value); };
    });
    measure("deliver/" + kind + "/signals2", [value] {
        using Signal = boost::signals2::signal<void(const ConfigurationValue&)>;
        auto signal = std::make_shared<Signal>();
        const auto subscriber = std::make_shared<CountingSubscriber>();
        signal->connect([subscriber](const ConfigurationValue& sent) {
            subscriber->onNext(ConfigurationValue(sent));
        });
        return [signal, value] { (*signal)(value); };
    });
}

// A watch that is opened, told the value there is, and cancelled, among `others`.
void measureLife(std::size_t others) {
    measure("watch/among:" + std::to_string(others) + "/velkor", [others] {
        const Store store = singleLayerStore(10'000);
        for (std::size_t i = 0; i < others; ++i) store->watchOption(keyNumber(i % 10'000));
        return [store, keys = KeyCycle(10'000)]() mutable {
            keep(reactive_streams::subscribe<ConfigurationValue>(
                *store->watchOption(keys.next()), {[](const ConfigurationValue&) {}}));
        };
    });
}

}  // namespace

void addOperations() {
    measureDelivery("int", intValue());
    for (const auto& [kind, value] : otherValues()) measureDelivery(kind, value);
    for (const std::size_t others : {0U, 100'000U}) measureLife(others);
}

}  // namespace velkor::benchmarks
