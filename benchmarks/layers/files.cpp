// Property files that are read again when they change: from the change to the watcher, and reading
// beside.

#include <chrono>
#include <condition_variable>
#include <cstddef>
#include <cstdint>
#include <filesystem>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <utility>

#include "benchmarks/support/Harness.hpp"
#include "benchmarks/support/PropertyText.hpp"
#include "configuration/sources/PropertyFileSource.hpp"
#include "framework/reactive_streams/CallbackSubscriber.hpp"
#include "layers/files/ReloadingFileSource.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::benchmarks {

namespace {

using configuration::PropertyFileSource;
using layers::ReloadingFileSource;
using testing::TemporaryFile;

constexpr std::size_t entriesOf100KB = 2'270;
constexpr std::size_t many = 10'000;
constexpr std::chrono::milliseconds quietTime{50};

// A followed file and a watcher of one of its keys.
class Reloaded {
public:
    explicit Reloaded(std::size_t entries)
        : texts{propertyText(entries), propertyText(entries) + watchedKey + "=changed\n"},
          contents{TemporaryFile(texts[0]), TemporaryFile(texts[1])},
          file(texts[0]) {
        store->addSource("file", "", 0, true, std::make_shared<ReloadingFileSource>(file.path()))
            .get();
        watching = reactive_streams::subscribe(
            *store->watchChanges(watchedKey),
            {[this](const configuration::OptionChange&) { note(); }, {}, {}});
    }

    // Puts the other content in the place of the file and waits until the watcher is told.
    void change() {
        next = 1 - next;
        const auto other = file.path().string() + ".new";
        std::filesystem::create_hard_link(contents[next].path(), other);
        std::unique_lock<std::mutex> lock(mutex);
        const auto before = told;
        std::filesystem::rename(other, file.path());
        noted.wait(lock, [&] { return told != before; });
    }

private:
    void note() {
        const std::lock_guard<std::mutex> lock(mutex);
        ++told;
        noted.notify_all();
    }

    const std::string watchedKey = "watched";
    const std::string texts[2];
    const TemporaryFile contents[2];
    const TemporaryFile file;
    std::size_t next = 0;
    std::mutex mutex;
    std::condition_variable noted;
    std::uint64_t told = 0;  // guarded by mutex
    Store store = emptyStore();
    reactive_streams::SubscriptionHandle watching;
};

void measureReloads() {
    measure("reload/100KB/quiet-time", [] {
        return [] { std::this_thread::sleep_for(quietTime); };
    }).elsewhere();
    measure("reload/100KB/velkor", [] {
        return [file = std::make_shared<Reloaded>(entriesOf100KB)] { file->change(); };
    }).elsewhere();
}

// Looks up keys of a file that `makeSource` makes a source of.
template <class MakeSource>
void measureGet(const std::string& contender, MakeSource makeSource) {
    measure("get/file/keys:10000/" + contender, [makeSource] {
        auto file = std::make_shared<TemporaryFile>(propertyText(many));
        Store store = emptyStore();
        store->addSource("file", "", 0, true, makeSource(*file)).get();
        return
            [file, store, keys = KeyCycle(many)]() mutable { keep(store->get(keys.next()).get()); };
    }).counted(1024);
}

void measureReading() {
    measureGet("plain", [](const TemporaryFile& file) {
        return std::make_shared<PropertyFileSource>(file.widePath());
    });
    measureGet("velkor", [](const TemporaryFile& file) {
        return std::make_shared<ReloadingFileSource>(file.path());
    });
}

}  // namespace

void addOperations() {
    measureReloads();
    measureReading();
}

}  // namespace velkor::benchmarks
