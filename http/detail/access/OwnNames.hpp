#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "http/ServerOptions.hpp"

namespace velkor::http::detail {

/// The names that clients may call the server by: those of the options, its addresses, and those of
/// the machine's own ("localhost", "127.0.0.1", "[::1]"). A page of somebody else whose name was
/// made to point here calls it by another one. A server that listens on all addresses may be called
/// by any address. Immutable: safe for concurrent use.
class OwnNames {
public:
    explicit OwnNames(const ServerOptions& options);

    /// Whether `host`, a "Host" header, calls the server by one of them, whatever the port is.
    bool contain(std::string_view host) const;

private:
    std::vector<std::string> names;
    bool anyAddress = false;
};

/// Whether both are the same but for the case of ASCII letters.
bool isSameName(std::string_view left, std::string_view right) noexcept;

}  // namespace velkor::http::detail
