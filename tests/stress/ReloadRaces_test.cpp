#include <gtest/gtest.h>

#include <algorithm>
#include <condition_variable>
#include <memory>
#include <mutex>
#include <random>
#include <set>
#include <string>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "framework/reactive_streams/CallbackSubscriber.hpp"
#include "layers/files/ReloadingFileSource.hpp"
#include "tests/layers/files/FileFolder.hpp"
#include "tests/stress/Race.hpp"
#include "tests/support/BoundedWait.hpp"

namespace velkor::layers {
namespace {

using configuration::ConfigurationImpl;
using configuration::OptionChange;
using testing::FileFolder;
using testing::Latch;

/// Files that are all read again one right after the other, beside what this thread does from the
/// first one on. A round takes the time that a file has to be quiet.
class ReloadRaces : public ::testing::Test {
protected:
    static constexpr std::size_t files = 16;
    static constexpr int roundsForOne = 20;

    struct Layer {
        std::shared_ptr<ConfigurationImpl> store;
        std::shared_ptr<ReloadingFileSource> source;
    };

    /// Which keys there are, by what is told.
    struct Told {
        void note(const OptionChange& change) {
            {
                const std::lock_guard<std::mutex> lock(mutex);
                if (change.option) {
                    present.insert(change.key);
                } else {
                    present.erase(change.key);
                }
                noted.notify_all();
            }
            first.countDown();
        }

        bool endsWithoutKeys() {
            std::unique_lock<std::mutex> lock(mutex);
            return noted.wait_for(lock, testing::patience, [this] { return present.empty(); });
        }

        Latch first;
        std::mutex mutex;
        std::condition_variable noted;
        std::set<std::string> present;
    };

    static int rounds() { return std::max(10, testing::stressRounds() / roundsForOne); }

    static std::string keyOf(std::size_t file) { return "key" + std::to_string(file); }

    std::shared_ptr<ReloadingFileSource> makeSource(std::size_t file) {
        FileFolder::replace(folder / keyOf(file), keyOf(file) + "=0\n");
        return std::make_shared<ReloadingFileSource>(folder / keyOf(file));
    }

    void changeFiles() {
        for (std::size_t i = 0; i < files; ++i) {
            FileFolder::replace(folder / keyOf(i), keyOf(i) + "=1\n");
        }
    }

    // The order in which this thread takes the files.
    std::vector<std::size_t> anyOrder() {
        std::vector<std::size_t> order(files);
        for (std::size_t i = 0; i < files; ++i) order[i] = i;
        std::shuffle(order.begin(), order.end(), random);
        return order;
    }

    auto follow(const std::shared_ptr<ConfigurationImpl>& store, std::size_t file,
                std::shared_ptr<ReloadingFileSource> source) {
        store->addSource(keyOf(file), "", 5, true, std::move(source)).get();
    }

    template <class F>
    static auto watch(ConfigurationImpl& store, F onChange) {
        return reactive_streams::subscribe(*store.watchChanges(""), {onChange, {}, {}});
    }

    FileFolder folder;
    std::mt19937 random{4711};
};

TEST_F(ReloadRaces, ReloadAgainstRemoval) {
    for (int round = 0; round < rounds(); ++round) {
        const auto store = std::make_shared<ConfigurationImpl>();
        for (std::size_t i = 0; i < files; ++i) follow(store, i, makeSource(i));
        const auto told = std::make_shared<Told>();
        const auto watching =
            watch(*store, [told](const OptionChange& change) { told->note(change); });

        changeFiles();
        ASSERT_TRUE(told->first.wait());
        for (const std::size_t file : anyOrder()) store->removeSource(keyOf(file)).get();

        ASSERT_TRUE(store->keys().get().empty());
        // The other thread may still have the last ones in its hands.
        ASSERT_TRUE(told->endsWithoutKeys());
    }
}

TEST_F(ReloadRaces, ReloadAgainstDestructionOfTheStore) {
    for (int round = 0; round < rounds(); ++round) {
        const auto first = std::make_shared<Latch>();
        std::vector<Layer> layers;
        std::vector<reactive_streams::SubscriptionHandle> watching;
        for (std::size_t i = 0; i < files; ++i) {
            layers.push_back({std::make_shared<ConfigurationImpl>(), makeSource(i)});
            follow(layers[i].store, i, layers[i].source);
            watching.push_back(
                watch(*layers[i].store, [first](const OptionChange&) { first->countDown(); }));
        }

        changeFiles();
        ASSERT_TRUE(first->wait());
        for (const std::size_t file : anyOrder()) layers[file].store.reset();

        for (std::size_t i = 0; i < files; ++i) {
            const auto text = boost::get<std::string>(layers[i].source->get(keyOf(i)));
            ASSERT_TRUE(text == "0" || text == "1");
        }
    }
}

TEST_F(ReloadRaces, ReloadAgainstTheEndOfTheSources) {
    for (int round = 0; round < rounds(); ++round) {
        const auto first = std::make_shared<Latch>();
        auto store = std::make_shared<ConfigurationImpl>();
        for (std::size_t i = 0; i < files; ++i) follow(store, i, makeSource(i));
        const auto watching = watch(*store, [first](const OptionChange&) { first->countDown(); });

        changeFiles();
        ASSERT_TRUE(first->wait());
        // The last sources go with their store, and their thread with them.
        for (const std::size_t file : anyOrder()) {
            if (file % 2 == 0) store->removeSource(keyOf(file)).get();
        }
        store.reset();
    }
}

TEST_F(ReloadRaces, LastReferenceDroppedInACallback) {
    for (int round = 0; round < rounds(); ++round) {
        struct Held {
            std::mutex mutex;
            Layer layer;
        };
        const auto drop = [](Held& held) {
            Layer last;
            const std::lock_guard<std::mutex> lock(held.mutex);
            std::swap(held.layer, last);
        };
        const auto done = std::make_shared<Latch>(files);
        std::vector<std::shared_ptr<Held>> all;
        std::vector<reactive_streams::SubscriptionHandle> watching;
        for (std::size_t i = 0; i < files; ++i) {
            auto held = std::make_shared<Held>();
            held->layer = {std::make_shared<ConfigurationImpl>(), makeSource(i)};
            follow(held->layer.store, i, held->layer.source);
            watching.push_back(watch(*held->layer.store, [held, drop, done](const OptionChange&) {
                drop(*held);
                done->countDown();
            }));
            all.push_back(std::move(held));
        }

        changeFiles();
        const bool allTold = round % 2 == 0;
        if (allTold) {
            ASSERT_TRUE(done->wait());
        } else {
            for (const std::size_t file : anyOrder()) drop(*all[file]);
        }
    }
}

}  // namespace
}  // namespace velkor::layers
