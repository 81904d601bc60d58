#pragma once

#include <algorithm>
#include <condition_variable>
#include <cstddef>
#include <functional>
#include <iterator>
#include <memory>
#include <mutex>
#include <string>
#include <tuple>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "framework/reactive_streams/CallbackSubscriber.hpp"
#include "layers/etcd/EtcdSource.hpp"
#include "tests/layers/etcd/server/EtcdMember.hpp"
#include "tests/support/ValueText.hpp"

namespace velkor::testing {

using layers::EtcdOptions;
using layers::EtcdSource;

/// A store with a layer in etcd, as a process of a fleet has it, and all that it tells of.
class FleetProcess {
public:
    FleetProcess(const std::vector<std::string>& endpoints, const std::string& prefix,
                 const EtcdOptions& options = {})
        : source(EtcdSource::open(endpoints, prefix, options)),
          watching(reactive_streams::subscribe(
              *store->watchChanges(""),
              {[this](const configuration::OptionChange& change) { note(change); }, {}, {}})) {
        store->addSource("fleet", "", 0, false, source).get();
        const std::lock_guard<std::mutex> lock(mutex);
        changes.clear();
    }

    /// "int 5", or "none".
    std::string at(const std::string& key) const {
        return store->has(key).get() ? textOf(store->get(key).get()) : "none";
    }

    /// Whether the key shows that soon.
    [[nodiscard]] bool shows(const std::string& key, const std::string& text) const {
        return comesAbout(
            [&] { return source->has(key) ? textOf(source->get(key)) == text : text == "none"; });
    }

    /// Whether the source is, or is not, connected soon.
    [[nodiscard]] bool becomesWell(bool well = true) const {
        return comesAbout([&] { return source->state().isWell == well; });
    }

    std::string detail(const std::string& name) const {
        for (const auto& each : source->state().details) {
            if (each.first == name) return each.second;
        }
        return "";
    }

    /// "KEY=int 5", or "KEY" alone when it has gone, in the order in which it was told. Waits for
    /// as many: a value can be read before it is told.
    std::vector<std::string> told(std::size_t least = 0) { return toldOf("", least); }

    /// What was told of the keys that `prefix` begins.
    std::vector<std::string> toldOf(const std::string& prefix, std::size_t least = 0) {
        std::vector<std::string> all;
        std::ignore = comesAbout([&] {
            all.clear();
            const std::lock_guard<std::mutex> lock(mutex);
            std::copy_if(changes.begin(), changes.end(), std::back_inserter(all),
                         [&](const std::string& each) {
                             return each.compare(0, prefix.size(), prefix) == 0;
                         });
            return all.size() >= least;
        });
        return all;
    }

    /// Why the last writes of this thread were not taken; empty: they were.
    template <class Exception = std::runtime_error>
    std::string refusal() const {
        try {
            source->committed().get();
            return "";
        } catch (const Exception& error) {
            return error.what();
        }
    }

    std::shared_ptr<configuration::ConfigurationImpl> store =
        std::make_shared<configuration::ConfigurationImpl>();
    std::shared_ptr<EtcdSource> source;

private:
    void note(const configuration::OptionChange& change) {
        const std::lock_guard<std::mutex> lock(mutex);
        changes.push_back(change.option ? change.key + "=" + textOf(change.option->value)
                                        : change.key);
    }

    std::mutex mutex;
    std::vector<std::string> changes;  // guarded by mutex
    reactive_streams::SubscriptionHandle watching;
};

}  // namespace velkor::testing
