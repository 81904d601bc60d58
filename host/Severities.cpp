#include "host/Severities.hpp"

#include <algorithm>
#include <array>
#include <charconv>
#include <stdexcept>

namespace velkor::host {

namespace {

struct NamedSeverity {
    common::Severity severity;
    std::string_view name;
};

constexpr std::array<NamedSeverity, 5> severities{{
    {common::fatal, "fatal"},
    {common::error, "error"},
    {common::warning, "warning"},
    {common::debug, "debug"},
    {common::trace, "trace"},
}};

constexpr unsigned everySeverity =
    common::fatal | common::error | common::warning | common::debug | common::trace;

unsigned parsePart(std::string_view part) {
    const auto named = std::find_if(severities.begin(), severities.end(),
                                    [&](const auto& each) { return each.name == part; });
    if (named != severities.end()) return named->severity;
    unsigned mask = 0;
    const char* end = part.data() + part.size();
    const auto [parsedEnd, error] = std::from_chars(part.data(), end, mask);
    if (error != std::errc() || parsedEnd != end || mask > everySeverity) {
        throw std::invalid_argument("Unknown severity: " + std::string(part));
    }
    return mask;
}

}  // namespace

std::string_view severityName(common::Severity severity) noexcept {
    const auto named = std::find_if(severities.begin(), severities.end(),
                                    [&](const auto& each) { return each.severity == severity; });
    return named == severities.end() ? std::string_view("unknown") : named->name;
}

unsigned parseSeverities(const std::string& text) {
    unsigned mask = 0;
    std::string_view rest = text;
    for (;;) {
        const std::size_t comma = std::min(rest.find(','), rest.size());
        mask |= parsePart(rest.substr(0, comma));
        if (comma == rest.size()) return mask;
        rest.remove_prefix(comma + 1);
    }
}

}  // namespace velkor::host
