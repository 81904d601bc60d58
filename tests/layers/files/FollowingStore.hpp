#pragma once

#include <algorithm>
#include <chrono>
#include <condition_variable>
#include <filesystem>
#include <functional>
#include <memory>
#include <mutex>
#include <stdexcept>
#include <string>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "framework/reactive_streams/CallbackSubscriber.hpp"
#include "layers/files/ReloadingFileSource.hpp"
#include "tests/layers/files/FileFolder.hpp"
#include "tests/support/BoundedWait.hpp"

namespace velkor::layers {

/// A store with files that are followed, and all that it tells of.
class FollowingStore {
public:
    explicit FollowingStore(const ReloadingFileOptions& options = {})
        : watching(reactive_streams::subscribe(
              *store->watchChanges(""),
              {[this](const configuration::OptionChange& change) { note(change); }, {}, {}})) {
        testing::FileFolder::write(fenceFolder / "fence", "fence=0\n");
        add("fence", std::make_shared<ReloadingFileSource>(fenceFolder / "fence", options));
    }

    /// Follows the file at `path`, which is the layer `name`.
    std::shared_ptr<ReloadingFileSource> follow(const std::filesystem::path& path,
                                                const ReloadingFileOptions& options = {},
                                                const std::string& name = "file") {
        auto source = std::make_shared<ReloadingFileSource>(path, options);
        add(name, source);
        return source;
    }

    /// Registers `source`; returns when its file is watched. Nothing of that counts as told.
    void add(const std::string& name, std::shared_ptr<ReloadingFileSource> source) {
        store->addSource(name, "", 5, true, std::move(source)).get();
        passFenceOnce();
        forgetTold();
    }

    /// Whether "KEY=TEXT", or "KEY" alone when it has gone, is told, or was.
    [[nodiscard]] bool isTold(const std::string& change) {
        return waitUntil(testing::patience, [&] {
            return std::find(changes.begin(), changes.end(), change) != changes.end();
        });
    }

    /// All that was told so far, in that order, but for the fences.
    std::vector<std::string> told() {
        const std::lock_guard<std::mutex> lock(mutex);
        return changes;
    }

    void forgetTold() {
        const std::lock_guard<std::mutex> lock(mutex);
        changes.clear();
    }

    /// Returns when a change that is made now to another file has been read. What happened before
    /// to a followed file has had its time then.
    void passFence() {
        // What is due together with the first one is done before the second one is.
        passFenceOnce();
        passFenceOnce();
    }

    std::string valueOf(const std::string& key) const {
        return boost::get<std::string>(store->get(key).get());
    }

    std::shared_ptr<configuration::ConfigurationImpl> store =
        std::make_shared<configuration::ConfigurationImpl>();

private:
    void passFenceOnce() {
        const auto number = std::to_string(++fences);
        const auto end = std::chrono::steady_clock::now() + testing::patience;
        do {
            if (std::chrono::steady_clock::now() > end) throw std::runtime_error("no fence passed");
            testing::FileFolder::replace(fenceFolder / "fence", "fence=" + number + "\n");
            // A change at the very moment at which the watch begins is taken for an unfinished one.
        } while (!waitUntil(std::chrono::milliseconds(200), [&] { return fencePassed == number; }));
    }

    template <class Condition>
    bool waitUntil(std::chrono::milliseconds limit, Condition condition) {
        std::unique_lock<std::mutex> lock(mutex);
        return noted.wait_for(lock, limit, condition);
    }

    void note(const configuration::OptionChange& change) {
        const std::lock_guard<std::mutex> lock(mutex);
        const std::string text = change.option ? boost::get<std::string>(change.option->value) : "";
        if (change.key == "fence") {
            fencePassed = text;
        } else {
            changes.push_back(change.option ? change.key + "=" + text : change.key);
        }
        noted.notify_all();
    }

    std::mutex mutex;
    std::condition_variable noted;
    std::vector<std::string> changes;  // guarded by mutex
    std::string fencePassed;           // guarded by mutex
    int fences = 0;
    testing::FileFolder fenceFolder;
    reactive_streams::SubscriptionHandle watching;
};

}  // namespace velkor::layers
