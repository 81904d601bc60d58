#include "settings/detail/StateIndex.hpp"

#include <algorithm>
#include <exception>
#include <set>
#include <utility>

#include "settings/detail/SettingState.hpp"

namespace velkor::settings::detail {

namespace {

void passOn(const configuration::OptionChange& change, SettingState& state) {
    try {
        state.onChange(change);
    } catch (const std::exception& error) {
        state.fail(error.what());
    }
}

}  // namespace

void StateIndex::pass(const configuration::OptionChange& change) const {
    std::exception_ptr unsaid;
    for (const auto& state : statesOf(change.key)) {
        try {
            passOn(change, *state);
        } catch (...) {
            unsaid = std::current_exception();  // the others are to be told all the same
        }
    }
    if (unsaid) std::rethrow_exception(unsaid);
}

StateIndex::States StateIndex::statesOf(const std::string& key) const {
    States found;
    const common::MutexLock lock(mutex);
    const auto entries = byKey.find(key);
    if (entries == byKey.end()) return found;
    for (const Entry& entry : entries->second) {
        if (auto state = entry.state.lock()) found.push_back(std::move(state));
    }
    return found;
}

std::vector<std::shared_ptr<SettingState>> StateIndex::all() const {
    std::set<std::shared_ptr<SettingState>> found;
    {
        const common::MutexLock lock(mutex);
        for (const auto& [key, entries] : byKey) {
            for (const Entry& entry : entries) {
                if (auto state = entry.state.lock()) found.insert(std::move(state));
            }
        }
    }
    return {found.begin(), found.end()};
}

void StateIndex::add(const std::shared_ptr<SettingState>& state) {
    const common::MutexLock lock(mutex);
    for (const Declared& key : state->keys()) byKey[key.key].push_back({state.get(), state});
}

void StateIndex::remove(const SettingState& state) {
    const common::MutexLock lock(mutex);
    for (const Declared& key : state.keys()) {
        const auto found = byKey.find(key.key);
        if (found == byKey.end()) continue;
        auto& entries = found->second;
        entries.erase(std::remove_if(entries.begin(), entries.end(),
                                     [&](const Entry& entry) { return entry.identity == &state; }),
                      entries.end());
        if (entries.empty()) byKey.erase(found);
    }
}

}  // namespace velkor::settings::detail
