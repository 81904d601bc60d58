#pragma once

#include <cstdint>
#include <optional>
#include <string>

#include "host/sources/EtcdRequest.hpp"

namespace velkor::host {

/// A source that the user wants.
struct SourceRequest {
    /// Behind "override" and before "default". Among sources of one order the one added last wins,
    /// so that files override those before them.
    static constexpr int defaultOrder = 1000;

    /// In front of the files, and behind what the command line sets by itself.
    static constexpr int environmentOrder = 200;

    /// In front of the files, which come with a machine, and behind what is said on it by hand.
    static constexpr int etcdOrder = 300;

    /// The order of the values that the command line sets by itself.
    static constexpr int commandLineOrder = 100;

    /// The kind of a property file.
    static constexpr const char* fileKind = "file";

    /// The kind of a layer in etcd.
    static constexpr const char* etcdKind = "etcd";

    bool isFile() const { return kind == fileKind; }

    std::optional<std::string> name{};  ///< Nothing: one is made from the location.
    /// Where its values are: for a file its path, for the environment the beginning of the names,
    /// for etcd the first endpoint.
    std::string location;
    std::string group{};
    int order = defaultOrder;
    bool writable = false;
    std::string kind = fileKind;        ///< See `sourceKind`.
    bool watched = false;               ///< It is read again when it changes, if it can be.
    bool mustBeReadable = false;        ///< A watched file that can't be read yet is a failure.
    std::optional<EtcdRequest> etcd{};  ///< For that kind.
};

/// The order that `text` names; nothing when it is no number of 32 bits.
std::optional<int> parseOrder(const std::string& text);

/// What the making of a source may cost.
struct SourceLimits {
    static constexpr std::uintmax_t usualFileBytes = std::uintmax_t{256} << 20U;

    std::uintmax_t fileBytes = usualFileBytes;  ///< The largest file that is read.
};

}  // namespace velkor::host
