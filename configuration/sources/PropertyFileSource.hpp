#pragma once

#include <memory>
#include <set>
#include <string>
#include <string_view>

#include "configuration/sources/ConfigurationSource.hpp"
#include "configuration/sources/ValueTable.hpp"

namespace velkor::configuration {

/// A read-only layer that holds the properties of one file. The file is read once, in the
/// constructor; later changes to it are not seen. Every value is narrow text (`std::string`), byte
/// for byte as in the file after escapes. Made by `std::make_shared`.
///
/// After construction the properties never change: concurrent `get`, `has` and `keys` are safe.
class VELKOR_EXPORT PropertyFileSource : public ConfigurationSource,
                                         public std::enable_shared_from_this<PropertyFileSource> {
public:
    /// Reads the property file at `path`. Throws `std::runtime_error` "Property file could not be
    /// opened: " followed by the path in UTF-8. Content never fails; a read error ends the file.
    explicit PropertyFileSource(const std::u16string& path);

    /// Takes `text` for the content of a property file, for a host that reads files its own way.
    explicit PropertyFileSource(std::string_view text);

    PropertyFileSource(const PropertyFileSource&) = delete;
    PropertyFileSource& operator=(const PropertyFileSource&) = delete;

    /// A copy of the value of `key`; `std::out_of_range` "_Map_base::at" when there is none.
    ConfigurationValue get(const std::string& key) override;

    /// Throws `std::runtime_error` "PropertyFileSource does not support writing".
    ConfigurationValue set(const std::string& key, ConfigurationValue value) override;

    bool has(const std::string& key) override;
    void setChangeListener(ChangeListener listener) override;
    std::set<std::string> keys() override;

    /// The values themselves. The store looks them up here: one search instead of `has` and `get`.
    const ValueTable& table() const noexcept { return properties; }

private:
    ValueTable properties;
    ChangeListener changeListener;
};

}  // namespace velkor::configuration
