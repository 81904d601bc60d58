#include "configuration/detail/SourceRegistry.hpp"

#include <algorithm>
#include <list>
#include <utility>

#include "configuration/detail/KeyPage.hpp"
#include "configuration/sources/PropertyFileSource.hpp"
#include "configuration/sources/TableSource.hpp"

namespace velkor::configuration::detail {

namespace {

constexpr char groupSeparator = '.';

auto isCalled(const std::string& name) {
    return [&name](const auto& entry) { return entry->name == name; };
}

}  // namespace

std::string normalisedGroup(std::string group) {
    if (!group.empty() && group.back() != groupSeparator) group += groupSeparator;
    return group;
}

RegisteredSource::RegisteredSource(ConfigurationSourceMap entry)
    : ConfigurationSourceMap(std::move(entry)),
      table(nullptr),
      texts(nullptr),
      forgetting(dynamic_cast<ForgettingSource*>(source.get())),
      monitored(dynamic_cast<const MonitoredSource*>(source.get())),
      grouping(dynamic_cast<GroupingSource*>(source.get())),
      attached(dynamic_cast<AttachedSource*>(source.get())),
      foreign(true) {
    if (const auto* const answering = dynamic_cast<const TableSource*>(source.get())) {
        table = answering->table();
        foreign = !answering->runsOwnCodeOnly();
    } else if (const auto* const file = dynamic_cast<const PropertyFileSource*>(source.get())) {
        texts = file->table();
        foreign = texts == nullptr;
    }
}

SourceRegistry::SourceRegistry() : current(std::make_shared<SourceList>()) {}

const RegisteredSource* SourceRegistry::find(const std::string& name) const {
    const auto found = std::find_if(current->begin(), current->end(), isCalled(name));
    return found == current->end() ? nullptr : found->get();
}

std::shared_ptr<RegisteredSource> SourceRegistry::insert(ConfigurationSourceMap entry) {
    auto added = std::make_shared<RegisteredSource>(std::move(entry));
    SourceList changed = *current;
    const auto position = std::find_if(changed.begin(), changed.end(), [&](const auto& present) {
        return present->order >= added->order;
    });
    changed.insert(position, added);
    replace(std::move(changed));
    return added;
}

void SourceRegistry::erase(const RegisteredSource& entry) {
    SourceList changed = *current;
    changed.erase(std::remove_if(changed.begin(), changed.end(),
                                 [&](const auto& present) { return present.get() == &entry; }),
                  changed.end());
    replace(std::move(changed));
}

const RegisteredSource* SourceRegistry::firstWritable(const std::string& key,
                                                      const std::string* sourceName) const {
    const auto found = std::find_if(current->begin(), current->end(), [&](const auto& entry) {
        return !entry->readOnly && entry->appliesTo(key) &&
               (sourceName == nullptr || entry->name == *sourceName);
    });
    return found == current->end() ? nullptr : found->get();
}

Layer SourceRegistry::firstHolder(const std::string& key, KeyBuffer& buffer) const {
    return nextHolder(current->data(), current->data() + current->size(), key, buffer);
}

std::vector<Option> SourceRegistry::holders(const std::string& key) {
    KeyBuffer buffer(buffers);
    const auto layers = current;
    const SourcePtr* const end = layers->data() + layers->size();
    const SourcePtr* from = layers->data();
    std::vector<Option> all;
    while (const Layer layer = nextHolder(from, end, key, buffer)) {
        all.emplace_back(key, layer.entry().name, layer.value());
        from = layer.position + 1;
    }
    return all;
}

// The walk: the first layer from `from` on that holds `key`.
Layer SourceRegistry::nextHolder(const SourcePtr* from, const SourcePtr* end,
                                 const std::string& key, KeyBuffer& buffer) {
    for (; from != end; ++from) {
        const RegisteredSource& entry = **from;
        if (!entry.appliesTo(key)) continue;
        const std::string& relativeKey = buffer.within(entry.group, key);
        if (entry.table != nullptr) {
            const ConfigurationValue* held = entry.table->find(relativeKey);
            if (held != nullptr) return {from, &relativeKey, held};
        } else if (entry.texts != nullptr) {
            const TextTable::Property* text = entry.texts->find(relativeKey);
            if (text != nullptr) return {from, &relativeKey, nullptr, text};
        } else if (entry.source->has(relativeKey)) {
            return {from, &relativeKey};
        }
    }
    return {};
}

std::vector<SourceDescription> SourceRegistry::describe(const SourceList& sources) {
    std::vector<SourceDescription> all;
    all.reserve(sources.size());
    for (const auto& entry : sources) {
        all.push_back({entry->name, entry->group, entry->order, entry->readOnly});
        if (entry->monitored != nullptr) all.back().state = entry->monitored->state();
    }
    return all;
}

std::set<std::string> SourceRegistry::keys() const {
    const SourceList& layers = *current;
    std::set<std::string> all;
    for (const auto& entry : layers) {
        auto layerKeys = entry->source->keys();
        if (entry->group.empty()) {
            if (all.empty()) all.swap(layerKeys);
            all.merge(layerKeys);
            continue;
        }
        while (!layerKeys.empty()) {
            auto node = layerKeys.extract(layerKeys.begin());
            node.value().insert(0, entry->group);
            all.insert(std::move(node));
        }
    }
    return all;
}

std::vector<std::string> SourceRegistry::keysFrom(const std::string& first,
                                                  std::size_t most) const {
    const auto layers = current;
    KeyPage page(first, most);
    std::list<std::set<std::string>> answers;  // the page refers to them
    for (const auto& entry : *layers) {
        if (entry->texts != nullptr) {
            page.addAll(entry->group, *entry->texts);
        } else if (entry->table != nullptr) {
            entry->table->forEachKey([&](const auto& key) { page.add(entry->group, key); });
        } else {
            answers.push_back(entry->source->keys());
            for (const auto& key : answers.back()) page.add(entry->group, key);
        }
    }
    return page.take();
}

void SourceRegistry::replace(SourceList changed) {
    const auto next = std::make_shared<const SourceList>(std::move(changed));
    current = next;
    foreign =
        std::any_of(next->begin(), next->end(), [](const auto& entry) { return entry->foreign; });
    asked = std::any_of(next->begin(), next->end(),
                        [](const auto& entry) { return !entry->hasTable(); });
}

}  // namespace velkor::configuration::detail
