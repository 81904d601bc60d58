#include "configuration/detail/SourceRegistry.hpp"

#include <algorithm>
#include <utility>

#include "configuration/sources/TableSource.hpp"

namespace velkor::configuration::detail {

namespace {

constexpr char groupSeparator = '.';

const ValueTable* tableOf(const ConfigurationSource& source) {
    const auto* const tableSource = dynamic_cast<const TableSource*>(&source);
    return tableSource == nullptr ? nullptr : tableSource->table();
}

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
      table(tableOf(*source)),
      forgetting(dynamic_cast<ForgettingSource*>(source.get())) {}

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

void SourceRegistry::erase(const std::string& name) {
    SourceList changed = *current;
    changed.erase(std::remove_if(changed.begin(), changed.end(), isCalled(name)), changed.end());
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
    Layer first;
    visitHolders(key, buffer, [&](const Layer& layer) {
        first = layer;
        return true;
    });
    return first;
}

std::vector<Option> SourceRegistry::holders(const std::string& key) {
    KeyBuffer buffer(buffers);
    std::vector<Option> all;
    visitHolders(key, buffer, [&](const Layer& layer) {
        all.emplace_back(key, layer.entry->name, layer.value());
        return false;
    });
    return all;
}

std::vector<SourceDescription> SourceRegistry::describe() const {
    std::vector<SourceDescription> all;
    all.reserve(current->size());
    for (const auto& entry : *current) {
        all.push_back({entry->name, entry->group, entry->order, entry->readOnly});
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

void SourceRegistry::replace(SourceList changed) {
    const bool nowForeign = std::any_of(changed.begin(), changed.end(),
                                        [](const auto& entry) { return entry->table == nullptr; });
    current = std::make_shared<const SourceList>(std::move(changed));
    foreign = nowForeign;
}

}  // namespace velkor::configuration::detail
