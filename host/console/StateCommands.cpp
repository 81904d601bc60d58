#include "host/console/StateCommands.hpp"

#include <charconv>
#include <chrono>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <utility>

#include "configuration/admin/TypedText.hpp"
#include "host/console/Command.hpp"
#include "host/console/Table.hpp"
#include "host/console/TimeText.hpp"
#include "host/console/ValueText.hpp"
#include "settings/Conversion.hpp"
#include "settings/Secrets.hpp"

namespace velkor::host {

namespace {

using configuration::ConfigurationValue;
using Arguments = std::vector<std::string>;
using SessionPtr = std::shared_ptr<SessionStore>;
using std::chrono::milliseconds;

constexpr std::size_t usualLimit = 20;
constexpr milliseconds longestLifetime = std::chrono::hours(24) * 36500;

StateLayer& stateOf(const SessionStore& store) {
    if (store.state() != nullptr) return *store.state();
    throw CommandError("Nothing lasts in this session; start it with --state FILE for that.");
}

template <class Number>
std::optional<Number> parseNumber(const std::string& text) {
    Number number{};
    const char* const end = text.data() + text.size();
    const auto [parsedEnd, error] = std::from_chars(text.data(), end, number);
    if (error != std::errc() || parsedEnd != end) return std::nullopt;
    return number;
}

milliseconds parseLifetime(const std::string& text) {
    const auto read = settings::Conversion<milliseconds>::from(ConfigurationValue(text));
    if (!read) throw CommandError("--for " + text + ": " + read.reason().text);
    if (read.value() > milliseconds::zero() && read.value() <= longestLifetime) return read.value();
    throw CommandError("--for " + text + ": not between 1ms and 36500d");
}

std::size_t parseLimit(const std::string& text) {
    const auto limit = parseNumber<std::size_t>(text);
    if (limit && *limit > 0) return *limit;
    throw CommandError("--limit " + text + ": a number from 1 on is needed");
}

/// The value of the option `name`, which may stand behind `least` to `most` other arguments.
/// Throws `refusal` when something else is there.
std::optional<std::string> optionBehind(std::size_t least, std::size_t most,
                                        const Arguments& arguments, const std::string& name,
                                        const char* refusal) {
    const std::size_t count = arguments.size();
    const bool isThere = count >= least + 2 && arguments[count - 2] == name;
    if (count > most + (isThere ? 2 : 0)) throw CommandError(refusal);
    if (isThere) return arguments.back();
    return std::nullopt;
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

std::string putValue(const SessionPtr& store, const Arguments& arguments) {
    const auto lifetime =
        optionBehind(2, 2, arguments, "--for", "What follows VALUE is no --for TIME.");
    ConfigurationValue value = configuration::typedText(arguments.at(1));
    if (!lifetime) {
        store->set(arguments.at(0), std::move(value)).get();
        return "";
    }
    StateLayer& state = stateOf(*store);
    const auto parsed = parseLifetime(*lifetime);
    store->noteWrite();
    state.setFor(arguments.at(0), std::move(value), parsed);
    return "";
}

std::string unsetKey(const SessionPtr& store, const Arguments& arguments) {
    const std::string& key = arguments.at(0);
    store->noteWrite();
    const bool wasThere = store->unset(key).get();
    if (!wasThere) throw CommandError("Nothing to unset: " + effectiveText(store, key));
    return effectiveText(store, key);
}

std::string showHistory(const SessionPtr& store, const Arguments& arguments) {
    const auto limit =
        optionBehind(0, 1, arguments, "--limit", "What follows KEY is no --limit N.");
    const bool hasKey = arguments.size() == (limit ? 3 : 1);
    return historyTable(store, stateOf(*store).history(hasKey ? arguments.front() : "",
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
