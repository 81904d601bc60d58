#include "host/MisplacedCommands.hpp"

#include <algorithm>
#include <filesystem>
#include <system_error>

#include "host/Options.hpp"
#include "host/console/CommandLine.hpp"

namespace velkor::host {

namespace {

bool isPlainFile(const SourceRequest& request) {
    return !request.name && request.isFile();
}

bool isThere(const std::string& path) {
    std::error_code unknown;
    return std::filesystem::exists(path, unknown);
}

}  // namespace

void refuseMisplacedCommands(const std::vector<SourceRequest>& requests,
                             const std::vector<std::string>& commands) {
    const auto command =
        std::find_if(requests.begin(), requests.end(), [&](const SourceRequest& request) {
            const std::string& word = request.location;
            return isPlainFile(request) &&
                   std::find(commands.begin(), commands.end(), word) != commands.end() &&
                   !isThere(word);
        });
    if (command == requests.end()) return;
    std::string line;
    for (auto word = command; word != requests.end() && isPlainFile(*word); ++word) {
        line += (line.empty() ? "" : " ") + quotedWord(word->location);
    }
    throw UsageError(command->location +
                     " is a command and no file; say: velkor-config [OPTIONS] [FILE...] -- " +
                     line + ", or -c \"" + line + '"');
}

}  // namespace velkor::host
