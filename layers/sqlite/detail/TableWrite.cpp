#include "layers/sqlite/detail/TableWrite.hpp"

#include <optional>
#include <utility>

#include "layers/sqlite/detail/WriteQueue.hpp"

namespace velkor::layers::detail {

using configuration::ConfigurationValue;
using configuration::ValueTable;

namespace {

void replace(ValueTable& values, const std::string& key,
             std::optional<ConfigurationValue>&& value) {
    if (!value) {
        values.take(key);
    } else if (ConfigurationValue* present = values.find(key)) {
        present->swap(*value);
    } else {
        values.insert(key, std::move(*value));
    }
}

}  // namespace

void complete(const ValueTable& values, Write& write) {
    if (const ConfigurationValue* present = values.find(write.entry.key)) {
        write.entry.before = *present;
    }
    write.weight = weightOf(write);
}

std::int64_t put(ValueTable& values, WriteQueue& queue, PreparedWrite&& write) {
    const JournalEntry& entry = write.write().entry;
    auto value = entry.after;
    replace(values, entry.key, std::move(value));
    return queue.accept(std::move(write));
}

void putBack(ValueTable& values, const Write& write) {
    auto value = write.entry.before;
    replace(values, write.entry.key, std::move(value));
}

}  // namespace velkor::layers::detail
