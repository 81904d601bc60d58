#include "layers/sqlite/JournalEntry.hpp"

namespace velkor::layers {

configuration::RecordedChange recorded(JournalEntry&& entry) {
    return {entry.change,
            entry.when,
            std::move(entry.author),
            std::string(nameOf(entry.action)),
            std::move(entry.key),
            std::move(entry.before),
            std::move(entry.after)};
}

}  // namespace velkor::layers
