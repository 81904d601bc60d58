#include "host/sources/SourceLoader.hpp"

#include <exception>
#include <new>
#include <set>
#include <stdexcept>

#include "host/lint/Remarks.hpp"
#include "host/sources/SourceKinds.hpp"
#include "host/sources/SourceStates.hpp"

namespace velkor::host {

namespace {

/// Gives each source without a name one that no other source has.
class SourceNames {
public:
    SourceNames(configuration::ConfigurationImpl& store,
                const std::vector<SourceRequest>& requests) {
        for (const auto& source : store.describeSources().get()) taken.insert(source.name);
        for (const auto& request : requests) {
            if (request.name) taken.insert(*request.name);
        }
    }

    std::string nameOf(const SourceRequest& request) {
        if (request.name) return *request.name;
        const std::string usual = sourceKind(request.kind).usualName(request);
        std::string name = usual;
        for (unsigned number = 2; !taken.insert(name).second; ++number) {
            name = usual + '-' + std::to_string(number);
        }
        return name;
    }

private:
    std::set<std::string> taken;
};

void loadSource(configuration::ConfigurationImpl& store, const std::string& name,
                const SourceRequest& request, const SourceLimits& limits, LoadedSources& loaded) {
    const auto [source, remarks] = sourceKind(request.kind).make(request, limits);
    const auto state = stateOf(*source);
    const bool isIll = state && !state->isWell;
    if (isIll && request.mustBeReadable) throw std::runtime_error(state->lastError);
    store.addSource(name, request.group, request.order, !request.writable, source).get();
    loaded.names.push_back(name);
    if (remarks != 0) loaded.notices.push_back(remarksNotice(request.location, remarks));
    if (!isIll) return;
    // A server that is away was allowed to be.
    if (request.isFile()) {
        loaded.failures.push_back(state->lastError);
    } else {
        loaded.notices.push_back(name + " began without its server: " + state->lastError);
    }
}

}  // namespace

LoadedSources loadSources(configuration::ConfigurationImpl& store,
                          const std::vector<SourceRequest>& requests, const SourceLimits& limits) {
    LoadedSources loaded;
    SourceNames names(store, requests);
    for (const auto& request : requests) {
        try {
            loadSource(store, names.nameOf(request), request, limits, loaded);
        } catch (const std::bad_alloc&) {
            loaded.failures.push_back("Out of memory while loading: " + request.location);
        } catch (const std::exception& error) {
            loaded.failures.emplace_back(error.what());
        }
    }
    return loaded;
}

}  // namespace velkor::host
