#pragma once

#include <memory>
#include <string>

#include "configuration/ConfigurationImpl.hpp"
#include "host/sources/SourceRequest.hpp"

namespace velkor::host {

/// The store of a session, whose user may lose patience: Ctrl-C ends a command that reads one value
/// after the other, and property files have a limit, those that messages name as well.
class SessionStore final : public configuration::ConfigurationImpl {
public:
    explicit SessionStore(const SourceLimits& sourceLimits) : limits(sourceLimits) {}

    /// As in the library; throws `Interrupted` once Ctrl-C was pressed.
    Future<configuration::ConfigurationValue> get(const std::string& key) override;

    /// As in the library, with the texts of `loadPropertyFile`.
    Future<bool> addPropertyFileSource(const std::string& name, const std::string& group, int order,
                                       bool readOnly, const std::u16string& path) override;

private:
    const SourceLimits limits;
};

}  // namespace velkor::host
