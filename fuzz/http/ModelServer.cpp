#include "fuzz/http/ModelServer.hpp"

#include <algorithm>
#include <map>
#include <set>
#include <stdexcept>

#include "configuration/service/ConfigurationJsonSerialization.hpp"
#include "configuration/service/ConfigurationMessages.hpp"
#include "fuzz/http/LiteralChanges.hpp"
#include "fuzz/http/LiteralJson.hpp"
#include "messages/JsonSerializerImpl.hpp"
#include "messages/JsonText.hpp"
#include "settings/Describe.hpp"

namespace velkor::fuzz::http {

using configuration::AppliedChange;
using configuration::Change;
using configuration::ConfigurationImpl;
using configuration::ConfigurationValue;
using configuration::Option;

namespace {

constexpr const char* secretKey = "s.pin";
constexpr const char* mark = "•••";

/// A refusal: its status, the end of its type, and its detail where that is documented.
struct Refused {
    int status;
    std::string type;
    std::string title;
    std::optional<std::string> detail{};
};

[[noreturn]] void refuse(int status, const std::optional<std::string>& detail = {}) {
    static const std::map<int, Refused> rows{
        {400, {400, "bad-request", "Bad request"}},
        {401, {401, "unauthorised", "Unauthorised"}},
        {403, {403, "forbidden", "Forbidden"}},
        {404, {404, "not-found", "Not found"}},
        {405, {405, "method-not-allowed", "Method not allowed"}},
        {409, {409, "not-writable", "Not writable"}},
        {500, {500, "internal", "Internal error"}},
    };
    Refused refused = rows.at(status);
    if (detail) refused.detail = detail->substr(0, detail->find('\0'));  // as texts of exceptions
    throw refused;
}

Expected refusal(const Refused& refused) {
    Expected answer{refused.status, "application/problem+json"};
    answer.body = R"({"type":"/problems/)" + refused.type + R"(","title":")" + refused.title +
                  R"(","status":)" + std::to_string(refused.status) + R"(,"detail":)";
    if (refused.detail) *answer.body += jsonText(*refused.detail) + '}';
    if (refused.status == 401) answer.headers.emplace_back("WWW-Authenticate", "Bearer");
    return answer;
}

Expected json(std::string text) {
    return {200, "application/json", std::move(text)};
}

Expected plain(std::string text) {
    return {200, "text/plain; charset=utf-8", std::move(text)};
}

// ---- What the request says

std::vector<std::string> headersCalled(const Request& request, std::string_view name) {
    std::vector<std::string> values;
    for (const auto& [sent, value] : request.headers) {
        if (sent == name) values.push_back(value);
    }
    return values;
}

std::string headerCalled(const Request& request, std::string_view name) {
    const auto values = headersCalled(request, name);
    return values.empty() ? "" : values.front();
}

void requireOwnName(const Request& request) {
    for (const char* const name : {"host", "origin", "authorization", "sec-fetch-site"}) {
        if (headersCalled(request, name).size() > 1) refuse(400);
    }
    const std::string host = headerCalled(request, "host");
    if (host.empty()) refuse(400);
    if (host == "evil.example") refuse(403);
    const std::string origin = headerCalled(request, "origin");
    const std::string own = (request.client.secure ? "https://" : "http://") + host;
    if (!origin.empty() && origin != own) refuse(403);
}

std::string decoded(const std::string& text) {
    std::string bytes;
    for (std::size_t i = 0; i < text.size(); ++i) {
        if (text[i] != '%') {
            bytes += text[i];
            continue;
        }
        const std::string digits = text.substr(i + 1, 2);
        const bool areDigits =
            digits.find_first_not_of("0123456789abcdefABCDEF") == std::string::npos;
        if (digits.size() != 2 || !areDigits) refuse(400);
        bytes += static_cast<char>(std::stoi(digits, nullptr, 16));
        i += 2;
    }
    return bytes;
}

std::vector<std::pair<std::string, std::string>> readQuery(const std::string& query) {
    std::vector<std::pair<std::string, std::string>> parameters;
    std::string part;
    for (const char byte : query + '&') {
        if (byte != '&') {
            part += byte;
            continue;
        }
        const std::size_t end = std::min(part.find('='), part.size());
        if (!part.empty()) {
            const std::string value = end == part.size() ? "" : part.substr(end + 1);
            parameters.emplace_back(decoded(part.substr(0, end)), decoded(value));
        }
        part.clear();
    }
    return parameters;
}

const std::map<std::string, std::set<std::string>>& parametersOfPaths() {
    static const std::map<std::string, std::set<std::string>> all{
        {"/watch", {"key"}}, {"/changes", {"prefix"}},
        {"/sources", {}},    {"/config", {"prefix", "cursor", "limit"}},
        {"/settings", {}},   {"/history", {"key", "limit"}},
        {"/healthz", {}},    {"/readyz", {}},
        {"/metrics", {}},
    };
    return all;
}

bool beginsWith(const std::string& text, const std::string& beginning) {
    return text.substr(0, beginning.size()) == beginning;
}

constexpr const char* messagePath = "/velkor/configuration/";
constexpr const char* keyPath = "/config/";

std::string methodsAt(const std::string& path) {
    if (path == "/config") return "GET, HEAD, PATCH";
    if (beginsWith(path, messagePath)) return "POST";
    const bool isRead =
        path == "/" || beginsWith(path, keyPath) || parametersOfPaths().count(path) != 0;
    return isRead ? "GET, HEAD" : "";
}

bool isOneOf(const std::string& list, const std::string& word) {
    return (", " + list + ",").find(", " + word + ",") != std::string::npos;
}

// Of who may write only.
bool isWrite(const Request& request, const std::string& path) {
    return request.method == "PATCH" || path == std::string(messagePath) + "ConfigurationSet" ||
           path == std::string(messagePath) + "AddPropertyFileSource";
}

const std::string* find(const std::vector<std::pair<std::string, std::string>>& parameters,
                        const std::string& name) {
    for (const auto& [each, value] : parameters) {
        if (each == name) return &value;
    }
    return nullptr;
}

std::size_t limitIn(const std::vector<std::pair<std::string, std::string>>& parameters,
                    std::size_t usual) {
    const std::string* const text = find(parameters, "limit");
    if (text == nullptr) return usual;
    if (text->empty() || text->find_first_not_of("0123456789") != std::string::npos) refuse(400);
    const std::string digits = text->substr(std::min(text->find_first_not_of('0'), text->size()));
    if (digits.empty() || digits.size() > 5 || std::stoul(digits) > 10000) refuse(400);
    return std::stoul(digits);
}

// What a refusal of the store is answered with.
[[noreturn]] void refuseFor(const std::exception& error) {
    const std::string text = error.what();
    for (const char* const begin :
         {"No writable configuration source for key: ", "Source not found or not writable: ",
          "Configuration source can't forget keys: ", "Changes refused: "}) {
        if (beginsWith(text, begin)) refuse(409, text);
    }
    refuse(beginsWith(text, "No option ") ? 404 : 500, text);
}

bool isMark(const ConfigurationValue& value) {
    return value == ConfigurationValue(std::string(mark)) ||
           value == ConfigurationValue(std::u16string(u"•••"));
}

}  // namespace

std::shared_ptr<ConfigurationImpl> makeStore() {
    auto store = std::make_shared<ConfigurationImpl>();
    store->addInMemorySource("site", "s.", 10, true,
                             {{"pin", 47},
                              {"\xE9", std::u16string(u"\xD800")},
                              {"list", std::vector<std::string>{"\"\x01", "\x80"}},
                              {"zero", -0.0}});
    return store;
}

settings::Setting<int> declarePin(const std::shared_ptr<ConfigurationImpl>& store) {
    return settings::Setting<int>(store, secretKey, 7, settings::between(0, 9999),
                                  settings::secret(), settings::description("how to enter"));
}

ModelServer::ModelServer(Manner itsManner) : manner(itsManner) {}

bool ModelServer::mayRead(const Request& request) const {
    const std::string authorization = headerCalled(request, "authorization");
    return !manner.hasTokens || authorization == std::string("Bearer ") + readToken ||
           authorization == std::string("bearer ") + writeToken;
}

bool ModelServer::mayWrite(const Request& request) const {
    const std::string authorization = headerCalled(request, "authorization");
    return manner.allowsWrites &&
           (!manner.hasTokens || authorization == std::string("bearer ") + writeToken);
}

Expected ModelServer::answer(const Request& request) {
    try {
        const std::string& target = request.target;
        if (target.empty() || target.front() != '/') refuse(400);
        requireOwnName(request);
        const std::size_t end = std::min(target.find('?'), target.size());
        return answerKnown(request, target.substr(0, end),
                           target.substr(std::min(end + 1, target.size())));
    } catch (const Refused& refused) {
        return refusal(refused);
    }
}

Expected ModelServer::answerKnown(const Request& request, const std::string& path,
                                  const std::string& query) {
    const std::string allowed = methodsAt(path);
    if (allowed.empty()) refuse(404, "There is nothing at " + path);
    if (!isOneOf(allowed, request.method)) {
        Expected other = refusal({405, "method-not-allowed", "Method not allowed"});
        if (request.method == "OPTIONS") other = {204, "", ""};
        other.headers.emplace_back("Allow", allowed);
        return other;
    }
    if (path != "/" && headerCalled(request, "sec-fetch-site") == "cross-site") refuse(403);
    const bool isFree = path == "/" || path == "/healthz" || path == "/readyz";
    if (!isFree && !mayRead(request)) refuse(401);
    writes = mayWrite(request);
    if (isWrite(request, path) && !writes) refuse(403);
    if (path == "/") return {200, "text/html; charset=utf-8"};
    const Parameters parameters = readQuery(query);
    std::set<std::string> known;
    if (request.method == "PATCH") {
        known = {"dry-run"};
    } else if (parametersOfPaths().count(path) != 0) {
        known = parametersOfPaths().at(path);
    }
    for (const auto& [name, value] : parameters) {
        if (known.erase(name) == 0) refuse(400);
    }
    if (request.method == "PATCH") return answerPatch(request, parameters);
    if (beginsWith(path, messagePath)) {
        const std::string type = path.substr(std::string(messagePath).size());
        return answerMessage(request, type);
    }
    return answerRead(path, parameters, request.method == "HEAD");
}

// ---- Messages

Expected ModelServer::optionReply(const Option& option) const {
    Expected answer =
        json("{\"key\":" + jsonText(option.key) + ",\"source\":" + jsonText(option.source) +
             ",\"value\":" + jsonValue(option.value, option.key == secretKey) + '}');
    answer.headers.emplace_back("Message-Type", "velkor/configuration/ConfigurationOptionResponse");
    return answer;
}

Expected ModelServer::answerMessage(const Request& request, const std::string& type) {
    static const auto registry = std::make_shared<messages::JsonSerializerImpl>();
    static const configuration::ConfigurationJsonSerialization registered(registry);
    static const std::set<std::string> requests{"ConfigurationGet", "ConfigurationSet",
                                                "ConfigurationKeys", "AddPropertyFileSource"};
    if (requests.count(type) == 0) {
        refuse(404, "Unknown message type: velkor/configuration/" + decoded(type));
    }
    std::unique_ptr<Message> message;
    try {
        message = registry->decode({"velkor/configuration/" + type, request.body});
    } catch (const messages::NoJsonObject& error) {
        refuse(400, error.what());
    }
    if (const auto* const get = dynamic_cast<configuration::ConfigurationGet*>(message.get())) {
        const auto option = store->read({get->key}).get().options.front();
        if (option) return optionReply(*option);
        Expected none = json("{}");
        none.headers.emplace_back("Message-Type",
                                  "velkor/configuration/ConfigurationOptionResponse");
        return none;
    }
    if (const auto* const set = dynamic_cast<configuration::ConfigurationSet*>(message.get())) {
        try {
            auto before = set->source.empty() ? store->set(set->key, set->value).get()
                                              : store->set(set->key, set->value, set->source).get();
            return optionReply({set->key, set->source, std::move(before)});
        } catch (const std::exception& error) {
            refuseFor(error);
        }
    }
    if (type == "AddPropertyFileSource") refuse(403);
    std::string keys;
    for (const std::string& key : store->keys().get()) {
        keys += (keys.empty() ? "" : ",") + jsonText(key);
    }
    Expected answer = json("{\"keys\":[" + keys + "]}");
    answer.headers.emplace_back("Message-Type", "velkor/configuration/ConfigurationKeysResponse");
    return answer;
}

// ---- Changes

Expected ModelServer::answerPatch(const Request& request, const Parameters& parameters) {
    const std::string* const dry = find(parameters, "dry-run");
    if (dry != nullptr && !dry->empty() && *dry != "true" && *dry != "false") refuse(400);
    const bool isDry = dry != nullptr && *dry != "false";
    const auto changes = readChanges(request.body);
    if (!changes) refuse(400);
    std::set<std::string> seen;
    for (const Change& change : *changes) {
        if (!seen.insert(change.key).second) refuse(400);
        if (change.key == secretKey && change.value && isMark(*change.value)) refuse(400);
    }
    std::vector<AppliedChange> applied;
    try {
        applied = store->apply(*changes, isDry).get();
    } catch (const std::exception& error) {
        refuseFor(error);
    }
    std::string text;
    for (const AppliedChange& change : applied) {
        text += (text.empty() ? "{" : ",{") + jsonKey(change.key) +
                ",\"source\":" + jsonText(change.source);
        if (change.before) {
            text += ",\"before\":" + jsonValue(*change.before, change.key == secretKey);
        }
        text += '}';
    }
    return json(std::string("{\"dryRun\":") + (isDry ? "true" : "false") + ",\"changes\":[" + text +
                "]}");
}

// ---- Reading

Expected ModelServer::answerRead(const std::string& path, const Parameters& parameters,
                                 bool isHead) {
    if (beginsWith(path, keyPath)) return layers(decoded(path.substr(8)));
    if (path == "/config") return page(parameters);
    if (path == "/sources") return json(sources());
    if (path == "/settings") return json(settingList());
    if (path == "/healthz") return plain("alive\n");
    if (path == "/readyz") return plain("ready\n");
    if (path == "/metrics") return {200, "text/plain; version=0.0.4; charset=utf-8"};
    if (path == "/history") {
        limitIn(parameters, 100);
        return json(R"({"kept":false,"changes":[]})");
    }
    const std::string* const wanted = find(parameters, path == "/watch" ? "key" : "prefix");
    if (path == "/watch" && wanted == nullptr) refuse(400);
    Expected stream{200, "text/event-stream", ""};
    if (isHead) return stream;
    if (path == "/watch") {
        stream.feed = std::make_unique<ModelWatch>(store, *wanted);
    } else {
        stream.feed = std::make_unique<ModelChanges>(store, wanted == nullptr ? "" : *wanted);
    }
    return stream;
}

std::string ModelServer::declared(const std::string& key) const {
    if (key != secretKey) return "";
    return R"(,"constraint":"between 0 and 9999","description":"how to enter","secret":true)";
}

Expected ModelServer::page(const Parameters& parameters) {
    const std::string* const prefix = find(parameters, "prefix");
    const std::string* const cursor = find(parameters, "cursor");
    const std::size_t limit = limitIn(parameters, 1000);
    std::vector<std::string> keys;
    for (const std::string& key : store->keys().get()) {
        const bool isMeant = prefix == nullptr || beginsWith(key, *prefix);
        if (isMeant && (cursor == nullptr || key > *cursor)) keys.push_back(key);
    }
    const bool hasMore = keys.size() > limit;
    if (hasMore) keys.resize(limit);
    std::string items;
    for (const std::string& key : keys) {
        const auto option = store->getOption(key).get();
        items += (items.empty() ? "{" : ",{") + jsonKey(key) +
                 ",\"value\":" + jsonValue(option.value, key == secretKey) +
                 ",\"source\":" + jsonText(option.source) + declared(key) + '}';
    }
    const std::string next = hasMore ? ",\"next\":" + jsonText(percentCode(keys.back())) : "";
    return json("{\"items\":[" + items + ']' + next + '}');
}

Expected ModelServer::layers(const std::string& key) {
    std::string all;
    for (const Option& option : store->explain(key).get()) {
        all += (all.empty() ? "{" : ",{") + ("\"source\":" + jsonText(option.source)) +
               ",\"value\":" + jsonValue(option.value, key == secretKey) + '}';
    }
    if (all.empty()) refuse(404, "No option with the specified key was found: " + key);
    return json('{' + jsonKey(key) + ",\"layers\":[" + all + ']' + declared(key) + '}');
}

std::string ModelServer::sources() const {
    std::string all;
    const auto add = [&](const char* name, const char* group, const char* order, bool readOnly) {
        all += std::string(all.empty() ? "" : ",") + R"({"name":")" + name + R"(","group":")" +
               group + R"(","order":)" + order + ",\"readOnly\":" + (readOnly ? "true" : "false") +
               R"(,"canForget":true,"journal":false})";
    };
    add("override", "", "0", false);
    add("site", "s.", "10", true);
    add("default", "", "2147483647", false);
    return std::string("{\"mayWrite\":") + (writes ? "true" : "false") + ",\"sources\":[" + all +
           "]}";
}

std::string ModelServer::settingList() const {
    const auto status = pin.status();
    return std::string(
               R"({"settings":[{"key":"s.pin","type":"int","default":"•••","value":"•••",)") +
           "\"source\":" + jsonText(status.source) +
           R"(,"constraint":"between 0 and 9999","description":"how to enter","secret":true,)" +
           R"("needsRestart":false)" +
           (status.error ? ",\"error\":" + jsonText(*status.error) : "") + "}]}";
}

}  // namespace velkor::fuzz::http
