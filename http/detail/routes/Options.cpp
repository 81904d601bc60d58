#include "http/detail/routes/Options.hpp"

#include <algorithm>
#include <utility>

#include "configuration/StoreErrors.hpp"
#include "http/detail/routes/Items.hpp"
#include "http/detail/routes/JsonWriter.hpp"
#include "http/detail/routes/Prefix.hpp"
#include "http/detail/routes/Problem.hpp"
#include "settings/Describe.hpp"

namespace velkor::http::detail {

namespace {

using configuration::Option;
using settings::Description;

constexpr std::size_t usualPage = 1000;
constexpr std::size_t largestPage = 10'000;

/// The keys of a page, and whether more follow.
struct PageOfKeys {
    std::vector<std::string> keys;
    bool hasMore = false;
};

// Those behind `cursor`, if there is one.
PageOfKeys pageOf(const KeyList::Keys& all, const std::string& prefix, const std::string* cursor,
                  std::size_t limit) {
    auto position = cursor == nullptr || *cursor < prefix
                        ? std::lower_bound(all.begin(), all.end(), prefix)
                        : std::upper_bound(all.begin(), all.end(), *cursor);
    PageOfKeys page;
    for (; position != all.end() && beginsWith(*position, prefix); ++position) {
        if (page.keys.size() == limit) {
            page.hasMore = true;
            break;
        }
        page.keys.push_back(*position);
    }
    return page;
}

void writeDeclared(JsonWriter& json, const Description& declared) {
    if (!declared.constraint.empty()) json.member("constraint", declared.constraint);
    if (!declared.description.empty()) json.member("description", declared.description);
    if (declared.secret) json.member("secret", true);
}

// What all settings of `key` say together.
Description declaredOf(const Context& context, const std::string& key) {
    Description all;
    for (Description& each : settings::describe(context.store, key)) {
        if (all.constraint.empty()) all.constraint = std::move(each.constraint);
        if (all.description.empty()) all.description = std::move(each.description);
        all.secret = all.secret || each.secret;
    }
    return all;
}

void writeItem(JsonWriter& json, const Option& option, const Description& declared) {
    json.beginObject();
    writeKey(json, option.key);
    json.name("value").value(option.value, declared.secret).member("source", option.source);
    writeDeclared(json, declared);
    json.endObject();
}

}  // namespace

Response optionPage(const Context& context, const Call& call) {
    const std::string* const prefix = find(call.parameters, "prefix");
    const PageOfKeys page = pageOf(
        *context.keys.of(*context.store), prefix == nullptr ? std::string() : *prefix,
        find(call.parameters, "cursor"), limitOf(call.parameters, "limit", usualPage, largestPage));
    const auto reading = context.store->read(page.keys).get();
    JsonWriter json;
    json.beginObject().name("items").beginArray();
    for (const auto& option : reading.options) {
        if (option) writeItem(json, *option, declaredOf(context, option->key));
    }
    json.endArray();
    if (page.hasMore) json.member("next", percentEncoded(page.keys.back()));
    json.endObject();
    return jsonResponse(json.take());
}

Response optionLayers(const Context& context, const Call& call) {
    const std::string& key = call.argument;
    const auto options = context.store->explain(key).get();
    if (options.empty()) {
        throw Problem(ProblemKind::notFound, configuration::store_errors::noSuchOption + key);
    }
    const Description declared = declaredOf(context, key);
    JsonWriter json;
    json.beginObject();
    writeKey(json, key);
    json.name("layers").beginArray();
    for (const Option& option : options) {
        json.beginObject().member("source", option.source);
        json.name("value").value(option.value, declared.secret).endObject();
    }
    json.endArray();
    writeDeclared(json, declared);
    json.endObject();
    return jsonResponse(json.take());
}

}  // namespace velkor::http::detail
