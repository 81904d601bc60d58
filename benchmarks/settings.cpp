// Reading typed settings, beside other ways to share a value with a thread that changes it.

#include "settings/Setting.hpp"

#include <atomic>
#include <chrono>
#include <cstddef>
#include <functional>
#include <memory>
#include <shared_mutex>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include "benchmarks/support/CountingSubscriber.hpp"
#include "benchmarks/support/Fixtures.hpp"
#include "benchmarks/support/Harness.hpp"
#include "benchmarks/support/Peers.hpp"

namespace velkor::benchmarks {

namespace {

using settings::Setting;

constexpr std::size_t batch = 1000;
constexpr std::size_t many = 10'000;
const std::string key = "site.value";

std::string text40() {
    return std::string(40, 'x');
}

Store storeWith(const ConfigurationValue& value) {
    auto store = singleLayerStore(1);
    store->set(key, value);
    return store;
}

// Reads `batch` times what the callable that `makeReader` gives reads, and adds it up.
template <class MakeReader>
Operation& measureReads(const std::string& name, MakeReader makeReader) {
    return measure(name,
                   [makeReader] {
                       return [made = makeReader()] {
                           auto read = made;  // where the compiler sees that nobody else changes it
                           unsigned sum = 0;
                           for (std::size_t i = 0; i < batch; ++i) {
                               sum += static_cast<unsigned>(read());
                               benchmark::ClobberMemory();
                           }
                           keep(sum);
                       };
                   })
        .perItemOf(batch)
        .counted(100);
}

// A value that others change under a lock.
template <class T>
struct Locked {
    explicit Locked(T initial) : value(std::move(initial)) {}

    std::shared_mutex mutex;
    T value;
};

// Does something again and again on a thread of its own while it lives.
class Background {
public:
    explicit Background(std::function<void()> work)
        : again(std::move(work)), thread([this] { run(); }) {}

    ~Background() {
        done = true;
        thread.join();
    }

    Background(const Background&) = delete;
    Background& operator=(const Background&) = delete;

private:
    void run() {
        while (!done) again();
    }

    const std::function<void()> again;
    std::atomic<bool> done{false};
    std::thread thread;  // the last member: it uses the others
};

void measureNumbers() {
    measureReads("setting/int/variable",
                 [] { return [value = std::make_shared<int>(5)] { return *value; }; });
    measureReads("setting/int/velkor", [] {
        const auto store = storeWith(5);
        return [store, setting = std::make_shared<Setting<int>>(store, key)] {
            return setting->get();
        };
    });
    measureReads("setting/int-beside-reader/velkor", [] {
        const auto store = storeWith(5);
        const auto setting = std::make_shared<Setting<int>>(store, key);
        return [store, setting, other = std::make_shared<Background>([setting] {
                                    for (std::size_t i = 0; i < batch; ++i) keep(setting->get());
                                })] { return setting->get(); };
    }).counted(0);
    measureReads("setting/int/store", [] {
        return [store = storeWith(5)] { return boost::get<int>(store->get(key).get()); };
    });
    measureReads("setting/int/poco", [] {
        const auto layers = pocoLayers(1, 1, "5");
        return [layers] { return layers->getInt(keyNumber(0)); };
    });
    measureReads("setting/int/shared-mutex", [] {
        return [held = std::make_shared<Locked<int>>(5)] {
            const std::shared_lock<std::shared_mutex> lock(held->mutex);
            return held->value;
        };
    });
    measureReads("setting/int/shared-pointer", [] {
        return [held = std::make_shared<std::shared_ptr<const int>>(std::make_shared<int>(5))] {
            return *std::atomic_load(held.get());
        };
    });
}

auto readText(const Store& store) {
    const auto setting = std::make_shared<Setting<std::string>>(store, key);
    return [setting, reader = setting->reader()]() mutable { return reader.get().size(); };
}

void measureTexts() {
    measureReads("setting/text40/variable", [] {
        return [value = std::make_shared<std::string>(text40())] { return value->size(); };
    });
    measureReads("setting/text40/velkor", [] { return readText(storeWith(text40())); });
    measureReads("setting/text40/beside-writer", [] {
        const auto store = storeWith(text40());
        const auto writer = std::make_shared<Background>([store] {
            store->set(key, text40());
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
        });
        return [read = readText(store), writer]() mutable { return read(); };
    }).counted(0);
    measureReads("setting/text40/store", [] {
        return [store = storeWith(text40())] {
            return boost::get<std::string>(store->get(key).get()).size();
        };
    });
    measureReads("setting/text40/poco", [] {
        const auto layers = pocoLayers(1, 1, text40());
        return [layers] { return layers->getString(keyNumber(0)).size(); };
    });
    measureReads("setting/text40/shared-mutex", [] {
        return [held = std::make_shared<Locked<std::string>>(text40())] {
            const std::shared_lock<std::shared_mutex> lock(held->mutex);
            return held->value.size();
        };
    });
    measureReads("setting/text40/shared-pointer", [] {
        using Held = std::shared_ptr<const std::string>;
        return [held = std::make_shared<Held>(std::make_shared<std::string>(text40()))] {
            return std::atomic_load(held.get())->size();
        };
    });
}

void measureChanges() {
    const auto watched = [](bool set) {
        return [set] {
            const auto store = storeWith(5);
            const auto watch = store->watchOption(key);
            watch->subscribe(std::make_shared<CountingSubscriber>());
            std::shared_ptr<Setting<int>> setting;
            if (set) setting = std::make_shared<Setting<int>>(store, key);
            return [store, setting, value = 0]() mutable { keep(store->set(key, ++value)); };
        };
    };
    measure("setting/change/without", watched(false));
    measure("setting/change/velkor", watched(true));
}

using Declared = std::vector<std::unique_ptr<Setting<int>>>;

Declared declareMany(const Store& store) {
    Declared declared;
    declared.reserve(many);
    for (std::size_t i = 0; i < many; ++i) {
        declared.push_back(std::make_unique<Setting<int>>(store, keyNumber(i), 1));
    }
    return declared;
}

void measureDeclaring() {
    for (const bool others : {false, true}) {
        measure(others ? "setting/change-beside-10000/velkor" : "setting/change-alone/velkor",
                [others] {
                    const auto store = storeWith(5);
                    auto declared = std::make_shared<Declared>();
                    if (others) *declared = declareMany(store);
                    declared->push_back(std::make_unique<Setting<int>>(store, key));
                    return
                        [store, declared, value = 0]() mutable { keep(store->set(key, ++value)); };
                });
    }
    measure("setting/declare/velkor",
            [] { return [store = singleLayerStore(many)] { keep(declareMany(store)); }; })
        .perItemOf(many)
        .counted(1);
    measure("setting/memory/velkor",
            [] {
                return [store = singleLayerStore(many), built = std::make_shared<Declared>()] {
                    *built = declareMany(store);
                };
            })
        .perItemOf(many)
        .weighsHeap();
}

}  // namespace

void addOperations() {
    measureNumbers();
    measureTexts();
    measureChanges();
    measureDeclaring();
}

}  // namespace velkor::benchmarks
