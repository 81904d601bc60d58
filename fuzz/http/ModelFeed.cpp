#include "fuzz/http/ModelFeed.hpp"

#include <algorithm>

#include "framework/reactive_streams/CallbackSubscriber.hpp"
#include "fuzz/http/LiteralJson.hpp"

namespace velkor::fuzz::http {

using configuration::ConfigurationImpl;
using configuration::ConfigurationValue;
using configuration::OptionChange;

namespace {

constexpr const char* secretKey = "s.pin";

}  // namespace

ModelWatch::ModelWatch(const std::shared_ptr<ConfigurationImpl>& store, std::string key)
    : watched(store),
      watchedKey(std::move(key)),
      handle(reactive_streams::subscribe<ConfigurationValue>(
          *store->watchOption(watchedKey),
          {[this](ConfigurationValue&& value) { newest = std::move(value); }})) {}

std::optional<std::string> ModelWatch::next() {
    if (!newest) return std::nullopt;
    const auto option = watched->read({watchedKey}).get().options.front();
    if (option) newest = option->value;
    const std::string json = jsonValue(*newest, watchedKey == secretKey);
    newest.reset();
    return event(json);
}

ModelChanges::ModelChanges(const std::shared_ptr<ConfigurationImpl>& store,
                           const std::string& prefix)
    : handle(reactive_streams::subscribe<OptionChange>(
          *store->watchChanges(prefix), {[this](OptionChange&& change) {
              const auto same =
                  std::find_if(waiting.begin(), waiting.end(),
                               [&](const OptionChange& each) { return each.key == change.key; });
              if (same == waiting.end()) {
                  waiting.push_back(std::move(change));
              } else {
                  *same = std::move(change);
              }
          }})) {}

std::optional<std::string> ModelChanges::next() {
    if (waiting.empty()) return std::nullopt;
    const OptionChange change = std::move(waiting.front());
    waiting.pop_front();
    std::string json = '{' + jsonKey(change.key);
    if (change.option) {
        json += ",\"value\":" + jsonValue(change.option->value, change.key == secretKey) +
                ",\"source\":" + jsonText(change.option->source);
    } else {
        json += ",\"gone\":true";
    }
    return event(json + '}');
}

}  // namespace velkor::fuzz::http
