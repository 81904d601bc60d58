#include "host/sources/SourceStates.hpp"

#include "host/console/TimeText.hpp"

namespace velkor::host {

using configuration::SourceState;

namespace {

std::string sinceText(const SourceState& state) {
    return state.since ? "since " + timeText(*state.since) : "";
}

void append(std::string& list, const std::string& item) {
    if (!item.empty()) list += (list.empty() ? "" : ", ") + item;
}

}  // namespace

std::optional<SourceState> stateOf(const configuration::ConfigurationSource& source) {
    const auto* const monitored = dynamic_cast<const configuration::MonitoredSource*>(&source);
    return monitored == nullptr ? std::nullopt : std::optional(monitored->state());
}

std::string problemText(const SourceState& state) {
    if (state.isWell) return "";
    const std::string since = sinceText(state);
    return since.empty() ? state.lastError : since + ": " + state.lastError;
}

std::string standingText(const SourceState& state) {
    if (state.details.empty()) return "";
    std::string text;
    if (state.isWell) append(text, sinceText(state));
    for (const auto& [name, detail] : state.details) append(text, name + ' ' + detail);
    if (state.updated) append(text, "as of " + timeText(*state.updated));
    if (state.isWell && !state.lastError.empty()) append(text, "last error: " + state.lastError);
    return text;
}

}  // namespace velkor::host
