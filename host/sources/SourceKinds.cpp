#include "host/sources/SourceKinds.hpp"

#include <algorithm>
#include <filesystem>
#include <iterator>
#include <stdexcept>
#include <system_error>

#include "host/lint/Remarks.hpp"
#include "host/sources/PropertyFile.hpp"
#include "layers/environment/EnvironmentSource.hpp"
#include "layers/files/ReloadingFileSource.hpp"

namespace velkor::host {

namespace {

std::string stemOfPath(const SourceRequest& request) {
    return std::filesystem::path(request.location).stem().string();
}

// Whether a file is there, or may still come, that can be read again: a pipe can't.
bool canBeWatched(const std::string& path) {
    std::error_code unknown;
    const auto kind = std::filesystem::status(path, unknown).type();
    return kind == std::filesystem::file_type::regular ||
           kind == std::filesystem::file_type::not_found;
}

// The text is parsed for its remarks and once more for its values: what a remark needs, the places
// of all lines and keys, is nothing that the source keeps or that other programs should pay for.
// The remarks come first, so that both never need memory at once.
MadeSource makePlainFile(const std::string& path, const SourceLimits& limits) {
    const std::string text = readPropertyFile(path, limits);
    const std::size_t remarks = countRemarks(text);
    return {std::make_shared<configuration::PropertyFileSource>(configuration::PropertyText{text}),
            remarks};
}

// The source has read the file for itself, and tells if it can't be read.
std::size_t remarksOnWatched(const std::string& path, const SourceLimits& limits) {
    try {
        return countRemarks(readPropertyFile(path, limits));
    } catch (const std::runtime_error&) {
        return 0;
    }
}

MadeSource makeFile(const SourceRequest& request, const SourceLimits& limits) {
    if (!request.watched || !canBeWatched(request.location)) {
        return makePlainFile(request.location, limits);
    }
    layers::ReloadingFileOptions options;
    options.mustBeReadable = false;
    options.mostBytes = limits.fileBytes;
    return {std::make_shared<layers::ReloadingFileSource>(request.location, options),
            remarksOnWatched(request.location, limits)};
}

std::string environmentName(const SourceRequest&) {
    return "environment";
}

MadeSource makeEnvironment(const SourceRequest& request, const SourceLimits&) {
    return {
        std::make_shared<layers::EnvironmentSource>(layers::EnvironmentNames(request.location))};
}

std::string etcdName(const SourceRequest&) {
    return SourceRequest::etcdKind;
}

MadeSource makeEtcd(const SourceRequest& request, const SourceLimits&) {
    return {openEtcd(request.etcd.value())};
}

constexpr SourceKind kinds[] = {
    {SourceRequest::fileKind, stemOfPath, makeFile},
    {"environment", environmentName, makeEnvironment},
    {SourceRequest::etcdKind, etcdName, makeEtcd},
};

}  // namespace

const SourceKind& sourceKind(std::string_view name) {
    const auto* const found = std::find_if(std::begin(kinds), std::end(kinds),
                                           [&](const auto& kind) { return kind.name == name; });
    if (found == std::end(kinds)) {
        throw std::invalid_argument("Unknown kind of source: " + std::string(name));
    }
    return *found;
}

}  // namespace velkor::host
