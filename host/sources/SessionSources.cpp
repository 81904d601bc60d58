#include "host/sources/SessionSources.hpp"

#include <algorithm>
#include <array>
#include <string_view>
#include <utility>

#include "host/SessionStore.hpp"
#include "host/console/Command.hpp"
#include "host/console/NearestNames.hpp"

namespace velkor::host {

namespace {

// Where `set` writes, and the layer of last resort.
constexpr std::array<std::string_view, 3> ownSources{"override", SessionStore::stateSource,
                                                     "default"};

std::string unknownSourceText(const std::string& name, const std::vector<std::string>& known) {
    const auto near = nearestNames(name, known);
    return "Unknown source: " + name +
           (near.empty() ? "" : " (did you mean: " + joinedNames(near) + "?)");
}

}  // namespace

SessionSources::SessionSources(std::shared_ptr<configuration::ConfigurationImpl> sessionStore,
                               const SourceLimits& sourceLimits, Notice showNotice)
    : store(std::move(sessionStore)), limits(sourceLimits), notice(std::move(showNotice)) {}

std::vector<std::string> SessionSources::begin(std::vector<SourceRequest> requests) {
    for (auto& request : requests) request.watched = watched;
    return add(requests).failures;
}

std::string SessionSources::load(SourceRequest request) {
    request.watched = watched;
    request.mustBeReadable = true;
    const auto loaded = add({std::move(request)});
    if (!loaded.failures.empty()) throw CommandError(loaded.failures.front());
    return loaded.names.front();
}

void SessionSources::unload(const std::string& name) {
    const auto known = names();
    if (std::find(known.begin(), known.end(), name) == known.end()) {
        throw CommandError(unknownSourceText(name, known));
    }
    if (std::find(ownSources.begin(), ownSources.end(), name) != ownSources.end()) {
        throw CommandError("The session needs its source: " + name);
    }
    store->removeSource(name).get();
}

std::vector<std::string> SessionSources::names() const {
    std::vector<std::string> names;
    for (const auto& source : store->describeSources().get()) names.push_back(source.name);
    return names;
}

LoadedSources SessionSources::add(const std::vector<SourceRequest>& requests) {
    auto loaded = loadSources(*store, requests, limits);
    for (const auto& text : loaded.notices) notice(text);
    return loaded;
}

}  // namespace velkor::host
