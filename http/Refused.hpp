#pragma once

#include <stdexcept>
#include <string>

#include "framework/common/Export.hpp"

namespace velkor::http {

/// Why a server does not start: what is wrong with its options, or what the system refused. The
/// text is meant for the operator; `ServerOptions` and `Server` say which there are.
class VELKOR_EXPORT Refused : public std::runtime_error {
public:
    /// What stands against it.
    enum class Cause {
        options,  ///< What was asked for, which is wrong at any time.
        system    ///< What the system refuses now: the address is taken, for example.
    };

    explicit Refused(const std::string& text, Cause refusedFor = Cause::options);
    Refused(const Refused&) = default;
    Refused& operator=(const Refused&) = default;
    ~Refused() override;

    Cause cause() const noexcept { return reason; }

private:
    Cause reason;
};

}  // namespace velkor::http
