#include "http/detail/routes/Layers.hpp"

#include <algorithm>
#include <optional>
#include <utility>

#include "configuration/sources/ForgettingSource.hpp"
#include "configuration/sources/JournaledSource.hpp"
#include "http/detail/routes/Items.hpp"
#include "http/detail/routes/JsonWriter.hpp"
#include "http/detail/routes/Prefix.hpp"
#include "settings/Describe.hpp"
#include "settings/Secrets.hpp"

namespace velkor::http::detail {

namespace {

using configuration::ConfigurationSource;
using configuration::ForgettingSource;
using configuration::JournaledSource;
using configuration::RecordedChange;
using configuration::SourceDescription;
using configuration::SourceState;

constexpr std::size_t usualHistory = 100;
constexpr std::size_t longestHistory = 10'000;

template <class Ability>
bool can(ConfigurationSource& source) {
    return dynamic_cast<Ability*>(&source) != nullptr;
}

void writeState(JsonWriter& json, const SourceState& state) {
    json.name("state").beginObject().member("well", state.isWell);
    if (state.since) json.member("since", utcText(*state.since));
    if (state.updated) json.member("updated", utcText(*state.updated));
    if (!state.lastError.empty()) json.member("lastError", state.lastError);
    json.name("details").beginObject();
    // The names are those of the sources, which may be of other libraries.
    for (const auto& [name, text] : state.details) json.anyName(name).text(text);
    json.endObject().endObject();
}

void writeSource(JsonWriter& json, const SourceDescription& description,
                 ConfigurationSource& source) {
    json.beginObject().member("name", description.name).member("group", description.group);
    json.name("order").number(description.order).member("readOnly", description.readOnly);
    json.member("canForget", can<ForgettingSource>(source));
    json.member("journal", can<JournaledSource>(source));
    if (description.state) writeState(json, *description.state);
    json.endObject();
}

void writeSetting(JsonWriter& json, const settings::Description& setting) {
    json.beginObject();
    writeKey(json, setting.key);
    json.member("type", setting.type);
    if (setting.defaultText) json.member("default", *setting.defaultText);
    if (setting.value) json.member("value", *setting.value);
    json.member("source", setting.source).member("constraint", setting.constraint);
    json.member("description", setting.description).member("secret", setting.secret);
    json.member("needsRestart", setting.needsRestart);
    if (setting.error) json.member("error", *setting.error);
    json.endObject();
}

// What a source with `group` is asked for when `wanted`, a full key, a prefix with "." at its end,
// or all of it (empty) is; nothing when it has none of that.
std::optional<std::string> withinGroup(const std::string& wanted, const std::string& group) {
    const bool isPrefix = wanted.empty() || wanted.back() == '.';
    if (isPrefix && beginsWith(group, wanted)) return std::string();
    if (!beginsWith(wanted, group) || wanted.size() == group.size()) return std::nullopt;
    return wanted.substr(group.size());
}

/// A change with the full key, and where it was made.
struct LayerChange {
    std::string source;
    RecordedChange change;
};

void writeValue(JsonWriter& json, const char* name,
                const std::optional<configuration::ConfigurationValue>& value, bool isSecret) {
    if (value) json.name(name).value(*value, isSecret);
}

void writeChange(JsonWriter& json, const LayerChange& made, bool isSecret) {
    const RecordedChange& change = made.change;
    json.beginObject().member("source", made.source);
    json.name("number").number(change.number).member("when", utcText(change.when));
    json.member("author", change.author).member("action", change.action);
    writeKey(json, change.key);
    writeValue(json, "before", change.before, isSecret);
    writeValue(json, "after", change.after, isSecret);
    json.endObject();
}

}  // namespace

void forEachSource(
    const Context& context,
    const std::function<void(const SourceDescription&, ConfigurationSource&)>& visit) {
    for (const auto& description : context.store->describeSources().get()) {
        const auto source = context.store->findSource(description.name).get();
        if (source != nullptr) visit(description, *source);
    }
}

Response sourceList(const Context& context, const Call& call) {
    JsonWriter json;
    json.beginObject().member("mayWrite", call.visitor.right == Right::write);
    json.name("sources").beginArray();
    forEachSource(context, [&](const SourceDescription& description, ConfigurationSource& source) {
        writeSource(json, description, source);
    });
    json.endArray().endObject();
    return jsonResponse(json.take());
}

Response settingList(const Context& context, const Call&) {
    JsonWriter json;
    json.beginObject().name("settings").beginArray();
    for (const auto& setting : settings::describe(context.store)) writeSetting(json, setting);
    json.endArray().endObject();
    return jsonResponse(json.take());
}

Response changeHistory(const Context& context, const Call& call) {
    const std::string* const key = find(call.parameters, "key");
    const std::string wanted = key == nullptr ? std::string() : *key;
    const std::size_t limit = limitOf(call.parameters, "limit", usualHistory, longestHistory);
    bool isKept = false;
    std::vector<LayerChange> changes;
    forEachSource(context, [&](const SourceDescription& layer, ConfigurationSource& source) {
        auto* const journaled = dynamic_cast<JournaledSource*>(&source);
        if (journaled == nullptr) return;
        isKept = true;
        const auto part = withinGroup(wanted, layer.group);
        if (!part) return;
        for (RecordedChange& change : journaled->changes(*part, limit)) {
            change.key.insert(0, layer.group);
            changes.push_back({layer.name, std::move(change)});
        }
    });
    std::stable_sort(changes.begin(), changes.end(), [](const auto& left, const auto& right) {
        return left.change.when > right.change.when;
    });
    changes.resize(std::min(changes.size(), limit));
    const auto secrets = settings::secretKeys(context.store);
    JsonWriter json;
    json.beginObject().member("kept", isKept).name("changes").beginArray();
    for (const LayerChange& made : changes) {
        writeChange(json, made, secrets.count(made.change.key) != 0);
    }
    json.endArray().endObject();
    return jsonResponse(json.take());
}

}  // namespace velkor::http::detail
