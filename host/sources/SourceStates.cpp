#include "host/sources/SourceStates.hpp"

#include "host/console/TimeText.hpp"

namespace velkor::host {

using configuration::SourceState;

namespace {

void append(std::string& list, const std::string& label, const std::string& text) {
    if (!list.empty()) list += ", ";
    list.append(label).append(" ").append(text);
}

}  // namespace

std::optional<SourceState> stateOf(const configuration::ConfigurationSource& source) {
    const auto* const monitored = dynamic_cast<const configuration::MonitoredSource*>(&source);
    return monitored == nullptr ? std::nullopt : std::optional(monitored->state());
}

std::string problemText(const SourceState& state) {
    if (state.isWell) return "";
    return (state.since ? "since " + timeText(*state.since) + ": " : "") + state.lastError;
}

std::string standingText(const SourceState& state) {
    if (state.details.empty()) return "";
    std::string text;
    if (state.isWell && state.since) append(text, "since", timeText(*state.since));
    for (const auto& [name, detail] : state.details) append(text, name, detail);
    if (state.updated) append(text, "as of", timeText(*state.updated));
    if (state.isWell && !state.lastError.empty()) append(text, "last error:", state.lastError);
    return text;
}

}  // namespace velkor::host
