#include "configuration/detail/Lookup.hpp"

#include "configuration/Loggers.hpp"

namespace velkor::configuration::detail {

ConfigurationValue Lookup::value() const {
    if (!storeLogger.isEnabled(common::debug)) return layer.value();
    storeLogger.write(common::debug, "get: ", key, " from ", layer.entry().name);
    return valueAfterRecord();
}

Option Lookup::option() const {
    const std::string& source = layer.entry().name;
    if (!storeLogger.isEnabled(common::debug)) return Option(key, source, layer.value());
    storeLogger.write(common::debug, "get option: ", key, " from ", source);
    return Option(key, source, valueAfterRecord());
}

// What stood in the table may be gone: a log sink can change the store.
ConfigurationValue Lookup::valueAfterRecord() const {
    return layer.entry().source->get(*layer.relativeKey);
}

}  // namespace velkor::configuration::detail
