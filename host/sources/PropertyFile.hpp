#pragma once

#include <memory>
#include <string>

#include "configuration/sources/PropertyFileSource.hpp"
#include "host/sources/SourceRequest.hpp"

namespace velkor::host {

/// The content of the file at `path`, which is read as a whole or not at all.
///
/// Throws `std::runtime_error`, in each text with the path after the first blank behind the colon:
/// - "Property file could not be opened: PATH: REASON", REASON being the system's; for a directory,
///   too;
/// - "Property file could not be read: PATH: REASON", also when a signal interrupts the reading;
/// - "Property file is larger than N bytes: PATH", N being the limit: no more is read than that.
///
/// Whatever can be read is a file: a pipe is read to its end, and waited for.
std::string readPropertyFile(const std::string& path, const SourceLimits& limits);

/// The source of the property file at `path`. Throws as `readPropertyFile`.
std::shared_ptr<configuration::PropertyFileSource> loadPropertyFile(const std::string& path,
                                                                    const SourceLimits& limits);

}  // namespace velkor::host
