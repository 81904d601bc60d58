#include "host/console/StateCommands.hpp"

#include <charconv>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <utility>

#include "host/console/Command.hpp"
#include "host/console/OptionWords.hpp"
#include "host/console/Table.hpp"
#include "host/console/TimeText.hpp"
#include "host/console/ValueText.hpp"
#include "settings/Secrets.hpp"

namespace velkor::host {

namespace {

using configuration::ConfigurationValue;
using Arguments = std::vector<std::string>;
using SessionPtr = std::shared_ptr<SessionStore>;

constexpr std::size_t usualLimit = 20;

template <class Number>
std::optional<Number> parseNumber(const std::string& text) {
    Number number{};
    const char* const end = text.data() + text.size();
    const auto [parsedEnd, error] = std::from_chars(text.data(), end, number);
    if (error != std::errc() || parsedEnd != end) return std::nullopt;
    return number;
}

std::size_t parseLimit(const std::string& text) {
    const auto limit = parseNumber<std::size_t>(text);
    if (limit && *limit > 0) return *limit;
    throw CommandError("--limit " + text + ": a number from 1 on is needed");
}

std::string effectiveText(const SessionPtr& store, const std::string& key) {
    const auto options = store->explain(key).get();
    if (options.empty()) return "No configuration option with key: " + key;
    const bool isSecret = settings::secretKeys(store).count(key) != 0;
    return optionText(key, options.front().value, isSecret) + " (" + options.front().source + ")";
}

std::string valueCell(const std::optional<ConfigurationValue>& value, bool isSecret) {
    return value ? valueText(*value, isSecret) : "-";
}

std::string historyTable(const SessionPtr& store,
                         const std::vector<configuration::RecordedChange>& changes) {
    const auto secrets = settings::secretKeys(store);
    std::vector<std::vector<std::string>> rows{
        {"CHANGE", "TIME", "WHO", "KEY", "ACTION", "BEFORE", "AFTER"}};
    for (const auto& change : changes) {
        const bool isSecret = secrets.count(change.key) != 0;
        rows.push_back({std::to_string(change.number), timeText(change.when), change.author,
                        change.key, change.action, valueCell(change.before, isSecret),
                        valueCell(change.after, isSecret)});
    }
    return formatTable(rows);
}

}  // namespace

StateLayer& stateOf(const SessionStore& store) {
    if (store.state() != nullptr) return *store.state();
    throw CommandError("Nothing lasts in this session; start it with --state FILE for that.");
}

std::string unsetKey(const SessionPtr& store, const Arguments& arguments) {
    const OptionWords given("unset", unsetUsage, 1, arguments);
    const std::string& key = given.words().front().text;
    const auto source = given.value("--source");
    store->noteWrite();
    const bool wasThere = (source ? store->unset(key, *source) : store->unset(key)).get();
    if (!wasThere) throw CommandError("Nothing to unset: " + effectiveText(store, key));
    return effectiveText(store, key);
}

std::string showHistory(const SessionPtr& store, const Arguments& arguments) {
    const OptionWords given("history", historyUsage, 0, arguments);
    const auto keys = given.texts();
    const auto limit = given.value("--limit");
    return historyTable(store, stateOf(*store).history(keys.empty() ? "" : keys.front(),
                                                       limit ? parseLimit(*limit) : usualLimit));
}

std::string undoChange(const SessionPtr& store, const Arguments& arguments) {
    StateLayer& state = stateOf(*store);
    std::optional<std::int64_t> number;
    if (!arguments.empty()) {
        number = parseNumber<std::int64_t>(arguments.front());
        if (!number) throw CommandError("N is no number of a change: " + arguments.front());
    }
    store->noteWrite();
    return historyTable(store, {state.undo(number)});
}

}  // namespace velkor::host
