#include "http/detail/routes/Patch.hpp"

#include <algorithm>
#include <exception>
#include <new>
#include <string_view>
#include <unordered_set>
#include <utility>

#include "framework/common/TextConversion.hpp"
#include "http/detail/routes/ChangeRequest.hpp"
#include "http/detail/routes/Commits.hpp"
#include "http/detail/routes/Items.hpp"
#include "http/detail/routes/JsonWriter.hpp"
#include "http/detail/routes/Problem.hpp"
#include "http/detail/routes/WriteRecord.hpp"
#include "settings/Secrets.hpp"

namespace velkor::http::detail {

namespace {

using configuration::AppliedChange;
using configuration::Change;

bool isDryRun(const Call& call) {
    const std::string* const text = find(call.parameters, "dry-run");
    if (text == nullptr || *text == "false") return false;
    if (text->empty() || *text == "true") return true;
    throw Problem(ProblemKind::badRequest, "\"dry-run\" must be true or false.");
}

Response changedResponse(const Context& context, const std::vector<AppliedChange>& changes,
                         bool dryRun) {
    const auto secrets = settings::secretKeys(context.store);
    JsonWriter json;
    json.beginObject().member("dryRun", dryRun).name("changes").beginArray();
    for (const AppliedChange& change : changes) {
        json.beginObject();
        writeKey(json, change.key);
        json.member("source", change.source);
        if (change.before) {
            json.name("before").value(*change.before, secrets.count(change.key) != 0);
        }
        json.endObject();
    }
    json.endArray().endObject();
    return jsonResponse(json.take());
}

std::vector<std::string> sourcesOf(const std::vector<AppliedChange>& changes) {
    std::vector<std::string> names;
    names.reserve(changes.size());
    for (const AppliedChange& change : changes) names.push_back(change.source);
    std::sort(names.begin(), names.end());
    names.erase(std::unique(names.begin(), names.end()), names.end());
    return names;
}

void write(const Context& context, Call& call, const std::vector<Change>& changes) {
    WriteRecord record(call);
    for (const Change& change : changes) record.add(change.key);
    std::vector<AppliedChange> applied;
    try {
        applied = context.store->apply(changes).get();
    } catch (const std::bad_alloc&) {
        throw;
    } catch (...) {
        return record.answer(call.answer, problemResponse(std::current_exception()));
    }
    const Sources sources = durableSources(*context.store, sourcesOf(applied));
    Response response = changedResponse(context, applied, false);
    answerOnceCommitted(sources, std::move(record), std::move(call.answer), std::move(response));
}

// Which a client that sends back what it was shown would write over the secret.
bool isMask(const configuration::ConfigurationValue& value) {
    const auto* const narrow = boost::get<std::string>(&value);
    const auto* const wide = boost::get<std::u16string>(&value);
    return (narrow != nullptr && *narrow == settings::secretMark) ||
           (wide != nullptr &&
            common::TextConversion("UTF-8").fromUtf16(*wide) == settings::secretMark);
}

void requireSound(const Context& context, const std::vector<Change>& changes) {
    std::unordered_set<std::string_view> seen;
    for (const Change& change : changes) {
        if (!seen.insert(change.key).second) {
            throw Problem(ProblemKind::badRequest, "A key is given twice: " + change.key);
        }
        if (change.value && isMask(*change.value) &&
            settings::isSecret(context.store, change.key)) {
            throw Problem(ProblemKind::badRequest,
                          "The value is what is shown in the place of a secret: " + change.key);
        }
    }
}

}  // namespace

void patchOptions(const Context& context, Call& call) {
    const bool dryRun = isDryRun(call);
    const auto changes = parsedChanges(call.request.body, context.jsonLimits);
    requireSound(context, changes);
    if (!dryRun) return write(context, call, changes);
    call.answer(changedResponse(context, context.store->apply(changes, true).get(), true));
}

}  // namespace velkor::http::detail
