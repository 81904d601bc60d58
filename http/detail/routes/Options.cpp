#include "http/detail/routes/Options.hpp"

#include <algorithm>
#include <set>
#include <unordered_map>
#include <utility>

#include "configuration/StoreErrors.hpp"
#include "http/detail/routes/Items.hpp"
#include "http/detail/routes/JsonWriter.hpp"
#include "http/detail/routes/Problem.hpp"
#include "settings/Describe.hpp"
#include "settings/Secrets.hpp"

namespace velkor::http::detail {

namespace {

using configuration::Option;
using settings::Description;

constexpr std::size_t usualPage = 1000;
constexpr std::size_t largestPage = 10'000;

bool beginsWith(const std::string& key, const std::string& prefix) {
    return key.compare(0, prefix.size(), prefix) == 0;
}

/// The keys of a page, and whether more follow.
struct PageOfKeys {
    std::vector<std::string> keys;
    bool hasMore = false;
};

// Those behind `cursor`, if there is one.
PageOfKeys pageOf(const std::set<std::string>& all, const std::string& prefix,
                  const std::string* cursor, std::size_t limit) {
    auto position =
        cursor == nullptr || *cursor < prefix ? all.lower_bound(prefix) : all.upper_bound(*cursor);
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

// Of several declarations of a key the first one that says something.
void writeDeclared(JsonWriter& json, const Description& description) {
    if (!description.constraint.empty()) json.member("constraint", description.constraint);
    if (!description.description.empty()) json.member("description", description.description);
}

using Declarations = std::unordered_map<std::string, Description>;

void addTo(Declarations& declarations, Description&& description) {
    Description& known = declarations.try_emplace(description.key).first->second;
    if (known.constraint.empty()) known.constraint = std::move(description.constraint);
    if (known.description.empty()) known.description = std::move(description.description);
    known.secret = known.secret || description.secret;
}

Declarations declarationsOf(std::vector<Description>&& descriptions) {
    Declarations declarations;
    for (Description& description : descriptions) addTo(declarations, std::move(description));
    return declarations;
}

void writeItem(JsonWriter& json, const Option& option, const Declarations& declarations) {
    const auto declared = declarations.find(option.key);
    const bool isDeclared = declared != declarations.end();
    const bool isSecret = isDeclared && declared->second.secret;
    json.beginObject();
    writeKey(json, option.key);
    json.name("value").value(option.value, isSecret).member("source", option.source);
    if (isDeclared) writeDeclared(json, declared->second);
    if (isSecret) json.member("secret", true);
    json.endObject();
}

}  // namespace

Response optionPage(const Context& context, const Call& call) {
    const std::string* const prefix = find(call.parameters, "prefix");
    const PageOfKeys page = pageOf(
        context.store->keys().get(), prefix == nullptr ? std::string() : *prefix,
        find(call.parameters, "cursor"), limitOf(call.parameters, "limit", usualPage, largestPage));
    const auto reading = context.store->read(page.keys).get();
    // Behind the reading: what is declared secret by then is not shown.
    const Declarations declarations = declarationsOf(settings::describe(context.store));
    JsonWriter json;
    json.beginObject().name("items").beginArray();
    for (const auto& option : reading.options) {
        if (option) writeItem(json, *option, declarations);
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
    const Declarations declarations = declarationsOf(settings::describe(context.store, key));
    const Description declared =
        declarations.empty() ? Description() : declarations.begin()->second;
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
    if (declared.secret) json.member("secret", true);
    json.endObject();
    return jsonResponse(json.take());
}

}  // namespace velkor::http::detail
