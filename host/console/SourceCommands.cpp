#include "host/console/SourceCommands.hpp"

#include <optional>
#include <utility>

#include "host/console/Command.hpp"
#include "host/console/OptionWords.hpp"

namespace velkor::host {

std::string loadFile(SessionSources& sources, const std::vector<std::string>& arguments) {
    const OptionWords given("load", loadUsage, 1, arguments);
    SourceRequest request{given.value("--name"), given.words().front().text};
    request.group = given.value("--group").value_or("");
    request.writable = given.has("--writable");
    if (const auto text = given.value("--order")) {
        const auto order = parseOrder(*text);
        if (!order) throw CommandError("--order " + *text + ": a number of 32 bits is needed");
        request.order = *order;
    }
    return "Loaded as " + sources.load(std::move(request)) + '.';
}

std::string unloadSource(SessionSources& sources, const std::vector<std::string>& arguments) {
    sources.unload(arguments.at(0));
    return "";
}

}  // namespace velkor::host
