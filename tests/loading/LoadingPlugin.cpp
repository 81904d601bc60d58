#include "tests/loading/LoadingPlugin.hpp"

#include <exception>
#include <filesystem>
#include <functional>
#include <memory>
#include <set>
#include <stdexcept>
#include <string>
#include <utility>

#include "configuration/ConfigurationImpl.hpp"
#include "framework/common/DiagnosticLogger.hpp"
#include "framework/reactive_streams/Publisher.hpp"
#include "tests/support/RecordingSubscriber.hpp"

namespace {

using velkor::configuration::ConfigurationImpl;
using velkor::configuration::ConfigurationValue;
using velkor::testing::allValues;
using velkor::testing::RecordingSubscriber;

constexpr int smallestOrder = 1;

void require(bool condition, const char* claim) {
    if (!condition) throw std::logic_error(claim);
}

ConfigurationValue text(const std::string& value) {
    return value;
}

void useSources(ConfigurationImpl& store, const char* propertyFile) {
    store.addInMemorySource("memory", "group", smallestOrder, false, {{"key", 1}}).get();
    store
        .addPropertyFileSource("file", "", smallestOrder, true,
                               std::filesystem::u8path(propertyFile).u16string())
        .get();
    require(store.get("group.key").get() == ConfigurationValue(1), "a memory source answers");
    require(store.get("file.key").get() == text("file value"), "a file source answers");
    require(store.getOption("file.key").get().source == "file", "an option names its source");
    require(store.keys().get().size() == 2, "all keys are listed");
    store.removeSource("memory").get();
    require(!store.has("group.key").get(), "a removed source is gone");
}

void useFailures(ConfigurationImpl& store) {
    bool failed = false;
    try {
        store.get("missing").get();
    } catch (const std::runtime_error&) {
        failed = true;
    }
    require(failed, "a missing key fails");
}

void useWatches(ConfigurationImpl& store) {
    const auto subscriber = std::make_shared<RecordingSubscriber<ConfigurationValue>>(allValues);
    {
        const auto stream = store.watchOption("watched");
        stream->subscribe(subscriber);
        store.set("watched", text("first")).get();
        store.set("watched", text("second")).get();
    }
    require(!subscriber->values.empty(), "a watcher is told");
    require(subscriber->values.back() == text("second"), "a watcher is told the newest value");
}

void useFutures() {
    velkor::Promise<int> promise;
    velkor::Future<std::string> next = promise.getFuture().then(
        [](velkor::Future<int>&& result) { return std::to_string(result.get()); });
    promise.setValue(12);
    require(next.get() == "12", "a continuation runs");
}

void useLoggers() {
    const velkor::common::DiagnosticLogger logger("loading-plugin");
    velkor::common::DiagnosticLogger::enable("velkor::configuration", 31);
    logger.write(velkor::common::fatal, "nobody reads this");
}

}  // namespace

void velkorUseConfiguration(const char* propertyFile, std::string& complaint) {
    try {
        const auto store = std::make_shared<ConfigurationImpl>();
        useLoggers();
        useSources(*store, propertyFile);
        useFailures(*store);
        useWatches(*store);
        useFutures();
    } catch (const std::exception& error) {
        complaint = error.what();
    }
}

void velkorLoadedObjects(velkor::testing::LoadedObjects& objects) {
    objects.store = std::make_shared<ConfigurationImpl>();
    objects.ownMessage = std::make_unique<velkor::testing::LoadedMessage>();
    objects.plainMessage = std::make_unique<velkor::Message>();
    objects.failed = velkor::makeFailedFuture<std::unique_ptr<velkor::Message>>(
        std::make_exception_ptr(std::make_exception_ptr(std::out_of_range("from the plugin"))));
}

bool velkorRecognises(const velkor::Message& message) {
    return dynamic_cast<const velkor::testing::LoadedMessage*>(&message) != nullptr;
}
