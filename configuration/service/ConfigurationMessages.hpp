#pragma once

#include <memory>
#include <set>
#include <string>
#include <utility>

#include "configuration/ConfigurationValue.hpp"
#include "configuration/Option.hpp"
#include "framework/Message.hpp"
#include "framework/ServiceMessage.hpp"
#include "framework/common/Export.hpp"

namespace velkor::configuration {

class VELKOR_EXPORT ConfigurationServiceProvider;
struct VELKOR_EXPORT ConfigurationGet;
struct VELKOR_EXPORT ConfigurationSet;
struct VELKOR_EXPORT ConfigurationKeys;
struct VELKOR_EXPORT AddPropertyFileSource;

}  // namespace velkor::configuration

// Instantiated once, by the library, where the provider is a complete type.
extern template class velkor::MessageAPI<velkor::configuration::ConfigurationGet,
                                         velkor::configuration::ConfigurationServiceProvider>;
extern template class velkor::MessageAPI<velkor::configuration::ConfigurationSet,
                                         velkor::configuration::ConfigurationServiceProvider>;
extern template class velkor::MessageAPI<velkor::configuration::ConfigurationKeys,
                                         velkor::configuration::ConfigurationServiceProvider>;
extern template class velkor::MessageAPI<velkor::configuration::AddPropertyFileSource,
                                         velkor::configuration::ConfigurationServiceProvider>;

namespace velkor::configuration {

/// Base of the requests that a `ConfigurationServiceProvider` answers.
template <class Request>
using ConfigurationRequest = MessageAPI<Request, ConfigurationServiceProvider>;

/// Asks for the effective value of a key. Answered by a `ConfigurationOptionResponse`.
struct VELKOR_EXPORT ConfigurationGet : ConfigurationRequest<ConfigurationGet> {
    ConfigurationGet() = default;
    explicit ConfigurationGet(std::string optionKey) : key(std::move(optionKey)) {}

    std::string key;
};

/// Writes a value. Answered by a `ConfigurationOptionResponse` with what the store's `set` gives.
struct VELKOR_EXPORT ConfigurationSet : ConfigurationRequest<ConfigurationSet> {
    ConfigurationSet() = default;
    ConfigurationSet(std::string optionKey, ConfigurationValue optionValue, std::string sourceName)
        : key(std::move(optionKey)), source(std::move(sourceName)), value(std::move(optionValue)) {}

    std::string key;
    std::string source;  ///< The source to write into; empty for the first one that takes the key.
    ConfigurationValue value;
};

/// Asks for all keys. Answered by a `ConfigurationKeysResponse`.
struct VELKOR_EXPORT ConfigurationKeys : ConfigurationRequest<ConfigurationKeys> {
    std::string filter;  ///< Empty, and read by nobody: a request lists every key.
};

/// Adds a property file as a source. Answered by a plain `Message`.
struct VELKOR_EXPORT AddPropertyFileSource : ConfigurationRequest<AddPropertyFileSource> {
    AddPropertyFileSource() = default;
    AddPropertyFileSource(std::string sourceName, std::string keyPrefix, int precedence,
                          bool isReadOnly, std::u16string filePath)
        : name(std::move(sourceName)),
          group(std::move(keyPrefix)),
          order(precedence),
          readOnly(isReadOnly),
          path(std::move(filePath)) {}

    std::string name;
    std::string group;
    int order = 0;
    bool readOnly = true;
    std::u16string path;  ///< In UTF-16.
};

/// One option, or none when there is no such key.
struct VELKOR_EXPORT ConfigurationOptionResponse : Message {
    ConfigurationOptionResponse() = default;
    explicit ConfigurationOptionResponse(std::unique_ptr<Option> found)
        : option(std::move(found)) {}

    std::unique_ptr<Option> option;  ///< Null when the key does not exist.
};

/// All keys, sorted byte by byte.
struct VELKOR_EXPORT ConfigurationKeysResponse : Message {
    ConfigurationKeysResponse() = default;
    explicit ConfigurationKeysResponse(std::set<std::string> allKeys) : keys(std::move(allKeys)) {}

    std::set<std::string> keys;
};

}  // namespace velkor::configuration
