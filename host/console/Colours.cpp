#include "host/console/Colours.hpp"

// Declares setupterm and tigetnum, and a macro for each ability of a terminal with term.h.
#include <curses.h>
#include <term.h>
#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <iterator>

namespace velkor::host {

namespace {

constexpr std::string_view separator = " = ";
constexpr std::string_view columnGap = "  ";
constexpr std::string_view ordinary = "\x1b[0m";

constexpr std::string_view sourceColour = "\x1b[34m";
constexpr std::string_view textColour = "\x1b[32m";
constexpr std::string_view numberColour = "\x1b[36m";
constexpr std::string_view truthColour = "\x1b[33m";
constexpr std::string_view arrayColour = "\x1b[35m";

std::string painted(std::string_view colour, std::string_view text) {
    if (colour.empty() || text.empty()) return std::string(text);
    return std::string(colour).append(text).append(ordinary);
}

bool begins(std::string_view beginning, std::string_view text) {
    return text.substr(0, beginning.size()) == beginning;
}

std::string_view colourOf(std::string_view value) {
    if (begins("'", value)) return textColour;
    if (begins("[", value)) return arrayColour;
    if (value == "true" || value == "false") return truthColour;
    const bool isNumber = !value.empty() && value.find_first_of("0123456789") != value.npos &&
                          value.find_first_not_of("0123456789.e+-") == value.npos;
    const bool isNoFiniteNumber = value == "inf" || value == "-inf" || value == "nan";
    return isNumber || isNoFiniteNumber ? numberColour : std::string_view();
}

std::string paintValue(std::string_view value) {
    return painted(colourOf(value), value);
}

std::string paintSource(std::string_view line) {
    if (begins("NAME  ", line)) return std::string(line);
    const std::string_view name = line.substr(0, line.find(columnGap));
    return painted(sourceColour, name).append(line.substr(name.size()));
}

// "effective  SOURCE  VALUE"
std::string paintExplanation(std::string_view line) {
    const std::size_t source = line.find_first_not_of(' ', line.find(columnGap));
    if (source == std::string_view::npos) return std::string(line);
    const std::size_t sourceEnd = std::min(line.find(columnGap, source), line.size());
    const std::size_t value = std::min(line.find_first_not_of(' ', sourceEnd), line.size());
    return std::string(line.substr(0, source)) +
           painted(sourceColour, line.substr(source, sourceEnd - source)) +
           std::string(line.substr(sourceEnd, value - sourceEnd)) + paintValue(line.substr(value));
}

struct PaintedCommand {
    std::string_view name;
    Paint paint;
};

constexpr PaintedCommand paintedCommands[] = {
    {"velkor.configuration.get", paintValue},
    {"velkor.configuration.list", paintOption},
    {"show", paintOption},
    {"diff", paintOption},
    {"unset", paintOption},
    {"sources", paintSource},
    {"explain", paintExplanation},
};

}  // namespace

std::string paintOption(std::string_view line) {
    const std::size_t found = line.find(separator);
    if (found == std::string_view::npos) return std::string(line);
    const std::size_t value = found + separator.size();
    const std::size_t bracket = line.rfind(" (");
    const bool namesSource =
        line.back() == ')' && bracket != std::string_view::npos && bracket > value;
    const std::size_t valueEnd = namesSource ? bracket : line.size();
    std::string text(line.substr(0, value));
    text += paintValue(line.substr(value, valueEnd - value));
    if (!namesSource) return text;
    const std::string_view source = line.substr(valueEnd + 2, line.size() - valueEnd - 3);
    return text + " (" + painted(sourceColour, source) + ')';
}

Paint paintOf(std::string_view command) {
    const auto* const found =
        std::find_if(std::begin(paintedCommands), std::end(paintedCommands),
                     [&](const PaintedCommand& each) { return each.name == command; });
    return found == std::end(paintedCommands) ? nullptr : found->paint;
}

bool terminalHasColours() {
    constexpr int colourCount = 8;
    const char* const unwanted = std::getenv("NO_COLOR");
    if (unwanted != nullptr && *unwanted != '\0') return false;
    int unknown = 0;
    if (setupterm(nullptr, STDOUT_FILENO, &unknown) != OK) return false;
    return tigetnum("colors") >= colourCount;
}

}  // namespace velkor::host
