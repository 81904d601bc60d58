#pragma once

#include <algorithm>
#include <chrono>
#include <condition_variable>
#include <filesystem>
#include <functional>
#include <memory>
#include <mutex>
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
    FollowingStore()
        : watching(reactive_streams::subscribe(
              *store->watchChanges(""),
              {[this](configuration::OptionChange change) { note(change); }, {}, {}})) {}

    /// Follows the file at `path`, which is the layer `name`.
    std::shared_ptr<ReloadingFileSource> follow(const std::filesystem::path& path,
                                                const ReloadingFileOptions& options = {},
                                                const std::string& name = "file") {
        const auto source = std::make_shared<ReloadingFileSource>(path, options);
        store->addSource(name, "", 5, true, source).get();
        return source;
    }

    /// Whether "KEY=TEXT", or "KEY" alone when it has gone, is told, or was.
    [[nodiscard]] bool isTold(const std::string& change) {
        return waitUntil(
            [&] { return std::find(changes.begin(), changes.end(), change) != changes.end(); });
    }

    /// All that was told so far, in that order, but for the fences.
    std::vector<std::string> told() {
        const std::lock_guard<std::mutex> lock(mutex);
        return changes;
    }

    /// Returns when a change that is made now to another file has been read. What happened before
    /// to a followed file has had its time then.
    void passFence() {
        const auto number = std::to_string(++fences);
        if (fence == nullptr) {
            testing::FileFolder::write(fenceFolder / "fence", "fence=0\n");
            fence = follow(fenceFolder / "fence", {}, "fence");
        }
        testing::FileFolder::replace(fenceFolder / "fence", "fence=" + number + "\n");
        if (!waitUntil([&] { return fencePassed == number; })) {
            throw std::runtime_error("the fence was not read");
        }
    }

    std::string valueOf(const std::string& key) const {
        return boost::get<std::string>(store->get(key).get());
    }

    std::shared_ptr<configuration::ConfigurationImpl> store =
        std::make_shared<configuration::ConfigurationImpl>();

private:
    template <class Condition>
    bool waitUntil(Condition condition) {
        std::unique_lock<std::mutex> lock(mutex);
        return noted.wait_for(lock, testing::patience, condition);
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
    std::shared_ptr<ReloadingFileSource> fence;
    reactive_streams::SubscriptionHandle watching;
};

}  // namespace velkor::layers
