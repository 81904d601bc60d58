#pragma once

#include <memory>
#include <string>
#include <string_view>

#include "configuration/sources/TableSource.hpp"

namespace velkor::configuration {

/// The content of a property file. Refers to it.
struct PropertyText {
    std::string_view content;
};

/// A read-only layer that holds the properties of one file. The file is read once, in the
/// constructor; later changes to it are not seen. Every value is narrow text (`std::string`), byte
/// for byte as in the file after escapes. Made by `std::make_shared`.
///
/// After construction the properties never change: concurrent `get`, `has` and `keys` are safe.
class VELKOR_EXPORT PropertyFileSource : public TableSource,
                                         public std::enable_shared_from_this<PropertyFileSource> {
public:
    /// Reads the property file at `path`. Throws `std::runtime_error` "Property file could not be
    /// opened: " followed by the path in UTF-8. Content never fails; a read error ends the file.
    explicit PropertyFileSource(const std::u16string& path);

    /// Takes `text` for the content of a property file, for a host that reads files its own way.
    explicit PropertyFileSource(PropertyText text);

    /// Throws `std::runtime_error` "PropertyFileSource does not support writing".
    ConfigurationValue set(const std::string& key, ConfigurationValue value) override;
};

}  // namespace velkor::configuration
