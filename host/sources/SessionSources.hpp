#pragma once

#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "host/sources/SourceLoader.hpp"
#include "host/sources/SourceRequest.hpp"

namespace velkor::host {

/// The sources of a session: those of its beginning, and those that come and go by commands. Used
/// by the thread that carries out commands.
class SessionSources {
public:
    using Notice = std::function<void(const std::string& text)>;

    /// For `store`, which is not null. What a source may cost is said by `sourceLimits`. What
    /// `loadSources` notices of sources that were added goes to `showNotice`.
    SessionSources(
        std::shared_ptr<configuration::ConfigurationImpl> store, const SourceLimits& sourceLimits,
        Notice showNotice = [](const auto&) {});

    /// Files are read again when they change, from now on, or they are not.
    void watchFiles(bool watches) noexcept { watched = watches; }

    /// Adds the requested sources in their order; gives what `loadSources` says of those that could
    /// not be added, or not be read yet.
    std::vector<std::string> begin(std::vector<SourceRequest> requests);

    /// Adds one source and gives its name. Throws `CommandError` with the text of `loadSources`
    /// when it can't be read; nothing is added then.
    std::string load(SourceRequest request);

    /// Removes the source called `name`. Throws `CommandError` "Unknown source: " with the name,
    /// and the similar ones, when there is none, and "The session needs its source: " for those
    /// that it has of itself, "override", "state" and "default".
    void unload(const std::string& name);

    /// The names of all sources in order of precedence.
    std::vector<std::string> names() const;

private:
    LoadedSources add(const std::vector<SourceRequest>& requests);

    const std::shared_ptr<configuration::ConfigurationImpl> store;
    const SourceLimits limits;
    const Notice notice;
    bool watched = false;
};

}  // namespace velkor::host
