#pragma once

#include <stdexcept>
#include <string>

#include "framework/common/Export.hpp"

namespace velkor::http {

/// Why a server does not start: what is wrong with its options, or what the system refused. The
/// text is meant for the operator; `ServerOptions` and `Server` say which there are.
class VELKOR_EXPORT Refused : public std::runtime_error {
public:
    explicit Refused(const std::string& text);
    Refused(const Refused&) = default;
    Refused& operator=(const Refused&) = default;
    ~Refused() override;
};

}  // namespace velkor::http
