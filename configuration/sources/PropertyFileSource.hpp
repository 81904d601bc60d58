#pragma once

#include <memory>
#include <set>
#include <string>
#include <string_view>
#include <typeinfo>

#include "configuration/sources/ConfigurationSource.hpp"
#include "configuration/sources/TextTable.hpp"

namespace velkor::configuration {

/// The content of a property file. Refers to it.
struct PropertyText {
    std::string_view content;
};

/// A read-only layer that holds the properties of one file. The file is read once, in the
/// constructor; later changes to it are not seen. Every value is narrow text (`std::string`), byte
/// for byte as in the file after escapes. Made by `std::make_shared`. The store looks keys up in
/// the table itself, as it does for a `TableSource`.
///
/// After construction the properties never change: concurrent `get`, `has` and `keys` are safe.
class VELKOR_EXPORT PropertyFileSource : public ConfigurationSource,
                                         public std::enable_shared_from_this<PropertyFileSource> {
public:
    /// Reads the property file at `path`. Throws `std::runtime_error` "Property file could not be
    /// opened: " followed by the path in UTF-8. Content never fails; a read error ends the file.
    explicit PropertyFileSource(const std::u16string& path);

    /// Takes `text` for the content of a property file, for a host that reads files its own way.
    explicit PropertyFileSource(PropertyText text);

    ~PropertyFileSource() override;

    PropertyFileSource(const PropertyFileSource&) = delete;
    PropertyFileSource& operator=(const PropertyFileSource&) = delete;

    /// The value of `key`; `std::out_of_range` "_Map_base::at" when there is none.
    ConfigurationValue get(const std::string& key) override;

    /// Throws `std::runtime_error` "PropertyFileSource does not support writing".
    ConfigurationValue set(const std::string& key, ConfigurationValue value) override;

    bool has(const std::string& key) override;

    /// Keeps `newListener`, which is never called.
    void setChangeListener(ChangeListener newListener) override;

    std::set<std::string> keys() override;

    /// The table, if this is exactly of this class; else null, since a class that derives from it
    /// may answer differently.
    const TextTable* table() const noexcept {
        return typeid(*this) == typeid(PropertyFileSource) ? &properties : nullptr;
    }

private:
    const TextTable properties;
    ChangeListener listener;
};

}  // namespace velkor::configuration
