#include "host/look/WordOptions.hpp"

#include "host/console/Command.hpp"

namespace velkor::host {

WordOptions parseOptionsAmong(const std::vector<std::string>& arguments,
                              const KnownOptions& known) {
    WordOptions options;
    bool onlyWords = false;
    for (auto argument = arguments.begin(); argument != arguments.end(); ++argument) {
        if (onlyWords || argument->compare(0, 2, "--") != 0) {
            options.words.push_back(*argument);
        } else if (*argument == "--") {
            onlyWords = true;
        } else if (known.flags.count(*argument) != 0) {
            options.flags.insert(*argument);
        } else if (known.withValue.count(*argument) == 0) {
            throw CommandError("Unknown option: " + *argument);
        } else if (argument + 1 == arguments.end()) {
            throw CommandError("A value is needed behind: " + *argument);
        } else {
            const std::string& name = *argument;
            options.values[name] = *++argument;
        }
    }
    return options;
}

}  // namespace velkor::host
