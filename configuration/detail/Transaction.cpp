#include "configuration/detail/Transaction.hpp"

#include "configuration/Loggers.hpp"
#include "configuration/StoreErrors.hpp"

namespace velkor::configuration::detail {

namespace {

std::optional<ConfigurationValue> heldBy(const RegisteredSource& target, const std::string& key,
                                         KeyBufferPool& buffers) {
    KeyBuffer buffer(buffers);
    const std::string& relativeKey = buffer.within(target.group, key);
    if (!target.source->has(relativeKey)) return std::nullopt;
    return target.source->get(relativeKey);
}

/// Lets those of the sources that can make one of all that is written while this lives.
class Groups {
public:
    explicit Groups(const std::vector<const RegisteredSource*>& all) : targets(all) {
        try {
            for (; begun < targets.size(); ++begun) begin(targets[begun]->grouping);
        } catch (...) {
            end();
            throw;
        }
    }

    ~Groups() { end(); }

    Groups(const Groups&) = delete;
    Groups& operator=(const Groups&) = delete;

private:
    static void begin(GroupingSource* source) {
        if (source != nullptr) source->beginGroup();
    }

    void end() noexcept {
        while (begun > 0) {
            GroupingSource* const source = targets[--begun]->grouping;
            if (source != nullptr) source->endGroup();
        }
    }

    const std::vector<const RegisteredSource*>& targets;
    std::size_t begun = 0;
};

}  // namespace

std::string refusalOf(const Change& change, const RegisteredSource* target) {
    if (target == nullptr) {
        return change.source ? store_errors::sourceNotWritable + change.key + ", " + *change.source
                             : store_errors::noWritableSource + change.key;
    }
    if (change.value || target->forgetting != nullptr) return "";
    return store_errors::cannotForget + change.key + ", " + target->name;
}

Transaction::Transaction(SourceRegistry& sources, const std::vector<Change>& wanted)
    : changes(wanted) {
    targets.reserve(changes.size());
    for (const Change& change : changes) {
        targets.push_back(
            sources.firstWritable(change.key, change.source ? &*change.source : nullptr));
    }
    if (!refusals().empty()) return;
    applied.reserve(changes.size());
    for (std::size_t i = 0; i < changes.size(); ++i) {
        const RegisteredSource& target = *targets[i];
        applied.push_back(
            {changes[i].key, target.name, heldBy(target, changes[i].key, sources.keyBuffers())});
    }
}

std::string Transaction::refusals() const {
    std::string all;
    for (std::size_t i = 0; i < changes.size(); ++i) {
        const std::string refusal = refusalOf(changes[i], targets[i]);
        if (!refusal.empty()) all += (all.empty() ? "" : "; ") + refusal;
    }
    return all;
}

void Transaction::write(SourceRegistry& sources) {
    const Groups groups(targets);
    for (std::size_t i = 0; i < changes.size(); ++i) {
        try {
            writeOne(sources, i, std::optional(changes[i].value));
        } catch (...) {
            takeBack(sources, i + 1);
            throw;
        }
    }
}

void Transaction::writeOne(SourceRegistry& sources, std::size_t index,
                           std::optional<ConfigurationValue>&& value) {
    const std::string& key = changes[index].key;
    const RegisteredSource& target = *targets[index];
    storeLogger.write(common::debug, value ? "set: " : "unset: ", key, "@", target.name);
    KeyBuffer buffer(sources.keyBuffers());
    const std::string& relativeKey = buffer.within(target.group, key);
    if (value) {
        target.source->set(relativeKey, *std::move(value));
    } else if (target.forgetting != nullptr) {
        target.forgetting->unset(relativeKey);
    }
}

void Transaction::takeBack(SourceRegistry& sources, std::size_t count) noexcept {
    while (count-- > 0) {
        try {
            // Moved, since memory may be what is short. Nobody asks for the outcome any more.
            writeOne(sources, count, std::move(applied[count].before));
        } catch (...) {
            // The source refuses: the others are restored all the same.
            continue;
        }
    }
}

}  // namespace velkor::configuration::detail
