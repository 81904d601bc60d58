#include "http/detail/routes/Messages.hpp"

#include <optional>
#include <utility>

#include "configuration/service/MessageTypes.hpp"
#include "http/detail/routes/Commits.hpp"
#include "http/detail/routes/JsonWriter.hpp"
#include "http/detail/routes/PlainGet.hpp"
#include "http/detail/routes/Problem.hpp"
#include "http/detail/routes/WriteRecord.hpp"
#include "messages/JsonText.hpp"
#include "settings/Secrets.hpp"

namespace velkor::http::detail {

namespace {

using namespace velkor::configuration;
using messages::JsonMessage;

constexpr const char* acknowledgement = "velkor/Message";

Response replyResponse(JsonMessage&& reply) {
    if (reply.type == acknowledgement) return {204, {}, {}, {}};
    Response response = jsonResponse(std::move(reply.json));
    response.headers.emplace_back("Message-Type", std::move(reply.type));
    return response;
}

template <class Message>
Response dispatched(const Context& context, const std::string& body) {
    auto result = context.dispatcher->dispatch({messageTypeOf<Message>.name(), body});
    if (auto* const reply = std::get_if<JsonMessage>(&result)) {
        return replyResponse(std::move(*reply));
    }
    const auto& error = std::get<messages::DispatchError>(result);
    return problemResponse(problemOf(error.failure), error.text);
}

// As the service answers, without a message in between.
Response optionReply(const Context& context, const std::string& key) {
    const auto option = context.store->read({key}).get().options.front();
    JsonWriter json;
    json.beginObject();
    if (option) {
        json.member("key", option->key).member("source", option->source).name("value");
        json.value(option->value, settings::isSecret(context.store, key));
    }
    json.endObject();
    return replyResponse({messageTypeOf<ConfigurationOptionResponse>.name(), json.take()});
}

// The member that says what is written; empty where the text is no object, which is refused later.
std::string memberOf(const Context& context, const std::string& body, const char* name) {
    try {
        return messages::parseJsonObject(body, context.jsonLimits)
            ->optValue<std::string>(name, std::string());
    } catch (const messages::NoJsonObject&) {
        return {};
    }
}

}  // namespace

void answerGet(const Context& context, Call& call) {
    const auto key = keyOfPlainGet(call.request.body);
    call.answer(key ? optionReply(context, std::string(*key))
                    : dispatched<ConfigurationGet>(context, call.request.body));
}

void answerKeys(const Context& context, Call& call) {
    call.answer(dispatched<ConfigurationKeys>(context, call.request.body));
}

void answerSet(const Context& context, Call& call) {
    WriteRecord record(call);
    record.add(memberOf(context, call.request.body, "key"));
    Response response = dispatched<ConfigurationSet>(context, call.request.body);
    if (response.status != 200) return record.answer(call.answer, std::move(response));
    const Sources sources = durableSources(*context.store);
    answerOnceCommitted(sources, std::move(record), std::move(call.answer), std::move(response));
}

void answerAddFile(const Context& context, Call& call) {
    WriteRecord record(call);
    record.add(memberOf(context, call.request.body, "name"));
    record.answer(call.answer, dispatched<AddPropertyFileSource>(context, call.request.body));
}

void answerUnknownType(const Context&, Call& call) {
    throw Problem(ProblemKind::notFound,
                  "Unknown message type: " + std::string(messageTypePrefix) + call.argument);
}

}  // namespace velkor::http::detail
