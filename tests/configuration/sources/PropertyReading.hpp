#pragma once

#include <string>

#include "configuration/sources/PropertyFileSource.hpp"
#include "tests/support/ReferencePropertyReader.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::testing {

/// Everything that `source` holds. A value that isn't narrow text throws `boost::bad_get`.
inline Properties propertiesOf(configuration::PropertyFileSource& source) {
    Properties properties;
    for (const std::string& key : source.keys()) {
        properties[key] = boost::get<std::string>(source.get(key));
    }
    return properties;
}

/// What a property file source makes of `file`.
inline Properties readProperties(const TemporaryFile& file) {
    configuration::PropertyFileSource source(file.widePath());
    return propertiesOf(source);
}

}  // namespace velkor::testing
