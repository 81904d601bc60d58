#include "host/sources/SourceLoader.hpp"

#include <exception>
#include <filesystem>
#include <set>

#include "framework/common/TextConversion.hpp"

namespace velkor::host {

namespace {

/// Gives each source without a name one that no other source has.
class SourceNames {
public:
    explicit SourceNames(const std::vector<SourceRequest>& requests) {
        for (const auto& request : requests) {
            if (request.name) taken.insert(*request.name);
        }
    }

    std::string nameOf(const SourceRequest& request) {
        if (request.name) return *request.name;
        const std::string stem = std::filesystem::path(request.path).stem().string();
        std::string name = stem;
        for (unsigned number = 2; !taken.insert(name).second; ++number) {
            name = stem + '-' + std::to_string(number);
        }
        return name;
    }

private:
    std::set<std::string> taken{"override", "default"};  // the store's own
};

}  // namespace

std::vector<std::string> loadSources(configuration::Configuration& store,
                                     const std::vector<SourceRequest>& requests) {
    std::vector<std::string> failures;
    SourceNames names(requests);
    const common::TextConversion conversion("UTF-8");
    for (const auto& request : requests) {
        try {
            store
                .addPropertyFileSource(names.nameOf(request), request.group, request.order,
                                       !request.writable, conversion.toUtf16(request.path))
                .get();
        } catch (const std::exception& error) {
            failures.emplace_back(error.what());
        }
    }
    return failures;
}

}  // namespace velkor::host
