#include "http/detail/routes/Route.hpp"

#include "http/detail/routes/Feeds.hpp"
#include "http/detail/routes/Health.hpp"
#include "http/detail/routes/Layers.hpp"
#include "http/detail/routes/Messages.hpp"
#include "http/detail/routes/Options.hpp"
#include "http/detail/routes/Page.hpp"
#include "http/detail/routes/Patch.hpp"
#include "http/detail/routes/Problem.hpp"

namespace velkor::http::detail {

namespace {

Response page(const Context&, const Call&) {
    return {200, "text/html; charset=utf-8", std::string(pageHtml()), pageHeaders()};
}

// A stream of which only the head is asked for is not opened.
bool answeredAsHead(Call& call) {
    if (call.request.method != "HEAD") return false;
    call.answer(Response{200, "text/event-stream", {}, {}});
    return true;
}

void watchKey(const Context& context, Call& call) {
    const std::string& key = required(call, "key");
    if (answeredAsHead(call)) return;
    call.answer(watchFeed(context.store, key, context.metrics));
}

void watchPrefix(const Context& context, Call& call) {
    if (answeredAsHead(call)) return;
    const std::string* const prefix = find(call.parameters, "prefix");
    call.answer(changeFeed(context.store, prefix == nullptr ? std::string() : *prefix,
                           context.changes, context.metrics));
}

std::vector<Route> allRoutes() {
    constexpr auto none = Right::none;
    constexpr auto read = Right::read;
    constexpr auto write = Right::write;
    constexpr auto caller = Place::caller;
    constexpr auto worker = Place::worker;
    const std::string_view get = "GET";
    const std::string_view post = "POST";
    return {
        {post, "/velkor/configuration/ConfigurationGet", read, caller, answerGet},
        {post, "/velkor/configuration/ConfigurationSet", write, worker, answerSet},
        {post, "/velkor/configuration/ConfigurationKeys", read, worker, answerKeys},
        {post, "/velkor/configuration/AddPropertyFileSource", write, worker, answerAddFile},
        {post, "/velkor/configuration/", read, caller, answerUnknownType},
        {get, "/watch", read, caller, watchKey, {"key"}},
        {get, "/changes", read, caller, watchPrefix, {"prefix"}},
        {get, "/config", read, worker, responding<optionPage>, {"prefix", "cursor", "limit"}},
        {"PATCH", "/config", write, worker, patchOptions, {"dry-run"}},
        {get, "/config/", read, caller, responding<optionLayers>},
        {get, "/sources", read, worker, responding<sourceList>},
        {get, "/settings", read, worker, responding<settingList>},
        {get, "/history", read, worker, responding<changeHistory>, {"key", "limit"}},
        {get, "/healthz", none, caller, responding<alive>},
        {get, "/readyz", none, caller, responding<ready>},
        {get, "/metrics", read, worker, responding<metricsText>},
        {get, "/", none, caller, responding<page>, {}, true},
    };
}

}  // namespace

bool Route::isAt(std::string_view requested) const noexcept {
    return hasArgument() ? requested.substr(0, path.size()) == path : requested == path;
}

const std::vector<Route>& routes() {
    static const std::vector<Route> all = allRoutes();
    return all;
}

const std::string& required(const Call& call, std::string_view name) {
    const std::string* const value = find(call.parameters, name);
    if (value == nullptr) {
        throw Problem(ProblemKind::badRequest,
                      "The query parameter \"" + std::string(name) + "\" is missing.");
    }
    return *value;
}

}  // namespace velkor::http::detail
