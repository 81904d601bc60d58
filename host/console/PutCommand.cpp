#include "host/console/PutCommand.hpp"

#include <algorithm>
#include <chrono>
#include <optional>
#include <utility>

#include "host/console/Command.hpp"
#include "host/console/OptionWords.hpp"
#include "host/console/StateCommands.hpp"
#include "host/console/Table.hpp"
#include "host/console/ValueText.hpp"
#include "host/console/ValueWords.hpp"
#include "settings/Conversion.hpp"
#include "settings/Secrets.hpp"

namespace velkor::host {

namespace {

using configuration::ConfigurationValue;
using configuration::Option;
using std::chrono::milliseconds;
using SessionPtr = std::shared_ptr<SessionStore>;

constexpr milliseconds longestLifetime = std::chrono::hours(24) * 36500;

/// A value that is to be stored.
struct Order {
    std::string key;
    ConfigurationValue value;
    std::optional<std::string> source{};
    std::optional<milliseconds> lifetime{};
};

milliseconds parseLifetime(const std::string& text) {
    const auto read = settings::Conversion<milliseconds>::from(ConfigurationValue(text));
    if (!read) throw CommandError("--for " + text + ": " + read.reason().text);
    if (read.value() > milliseconds::zero() && read.value() <= longestLifetime) return read.value();
    throw CommandError("--for " + text + ": not between 1ms and 36500d");
}

ConfigurationValue valueOf(const OptionWords& given) {
    const auto& words = given.words();
    if (const auto type = given.value("--type")) {
        std::vector<std::string> texts;
        for (auto word = words.begin() + 1; word != words.end(); ++word) {
            texts.push_back(word->text);
        }
        return typedValue(*type, texts);
    }
    if (words.size() != 2) throw CommandError(std::string("put takes ") + putUsage);
    const Word& word = words.back();
    return word.isQuoted ? ConfigurationValue(word.text) : wordValue(word.text);
}

Order readOrder(const SessionStore& store, const OptionWords& given) {
    Order order{given.words().front().text, valueOf(given), given.value("--source"), std::nullopt};
    if (const auto lifetime = given.value("--for")) {
        stateOf(store);
        order.lifetime = parseLifetime(*lifetime);
        if (order.source.value_or(SessionStore::stateSource) != SessionStore::stateSource) {
            throw CommandError("--for stores in the layer that lasts, and not in " + *order.source);
        }
        order.source = SessionStore::stateSource;
    }
    return order;
}

/// Whether the source called `one` wins over the one called `other`.
bool isAbove(SessionStore& store, const std::string& one, const std::string& other) {
    const auto sources = store.describeSources().get();
    const auto first = std::find_if(sources.begin(), sources.end(), [&](const auto& source) {
        return source.name == one || source.name == other;
    });
    return first != sources.end() && one != other && first->name == one;
}

std::string effectiveCell(const std::optional<Option>& option, bool isSecret) {
    if (!option) return "-";
    return valueText(option->value, isSecret) + " (" + option->source + ')';
}

std::string preview(const SessionPtr& store, const Order& order) {
    const auto outcome = store->apply({{order.key, order.value, order.source}}, true).get();
    const std::string& target = outcome.front().source;
    const auto& before = outcome.front().before;
    const bool isSecret = settings::secretKeys(store).count(order.key) != 0;

    std::optional<Option> now;
    const auto holders = store->explain(order.key).get();
    if (!holders.empty()) now = holders.front();
    const bool isCovered = now && isAbove(*store, now->source, target);
    const Option written{order.key, target, order.value};
    return formatTable(
        {{"LAYER", "NOW", "THEN"},
         {target, before ? valueText(*before, isSecret) : "-", valueText(order.value, isSecret)},
         {"effective", effectiveCell(now, isSecret),
          effectiveCell(isCovered ? now : written, isSecret)}});
}

void carryOut(const SessionPtr& store, Order order) {
    if (order.lifetime) {
        store->noteWrite();
        stateOf(*store).setFor(order.key, std::move(order.value), *order.lifetime);
    } else if (order.source) {
        store->set(order.key, std::move(order.value), *order.source).get();
    } else {
        store->set(order.key, std::move(order.value)).get();
    }
}

}  // namespace

std::string putValue(const SessionPtr& store, const std::vector<std::string>& arguments) {
    const OptionWords given("put", putUsage, 1, arguments);
    Order order = readOrder(*store, given);
    if (given.has("--dry-run")) return preview(store, order);
    carryOut(store, std::move(order));
    return "";
}

}  // namespace velkor::host
