#include "benchmarks/fleet/FleetOptions.hpp"

#include <algorithm>
#include <functional>
#include <map>
#include <random>
#include <string>
#include <string_view>

namespace velkor::benchmarks {

const char* const fleetUsage =
    R"(usage: bench-fleet [OPTION...]

Simulates a fleet on this machine: processes with settings on a layer in etcd, some of which write,
while members of etcd are killed and frozen at random. Starts etcd by itself, on free ports of the
loopback interface, with its data in memory, and ends all that it has started.

  --processes N   processes (50)
  --settings N    settings of each, the same ones (100)
  --members N     members of etcd (3)
  --writers N     processes that write too (5)
  --rate N        writes a second, all writers together (40)
  --quiet N       seconds of writing without faults, which come first (10)
  --seconds N     seconds of writing with faults (60)
  --faults on|off whether members are killed and frozen (on)
  --seed N        of the faults and of what is written (a random one, which is printed)
  --short         --processes 5 --settings 20 --quiet 1 --seconds 5
  --help          this text

Ends with 0 when all promises were kept, 1 when one was broken, 2 when it could not find out.
)";

namespace {

using Words = std::map<std::string, std::function<void(const std::string&)>>;

double number(const std::string& text, double least, double most) {
    std::size_t used = 0;
    double value = 0;
    try {
        value = std::stod(text, &used);
    } catch (const std::exception&) {
        used = 0;
    }
    if (used == 0 || used != text.size() || value < least || value > most) {
        throw BadOptions("Not a number from " + std::to_string(static_cast<long>(least)) + " to " +
                         std::to_string(static_cast<long>(most)) + ": " + text);
    }
    return value;
}

auto whole(int& target, int most) {
    return [&target, most](const std::string& text) {
        target = static_cast<int>(number(text, 1, most));
    };
}

bool truth(const std::string& text) {
    if (text != "on" && text != "off") throw BadOptions("Neither on nor off: " + text);
    return text == "on";
}

void makeShort(FleetOptions& options) {
    options.processes = 5;
    options.writers = 2;
    options.settings = 20;
    options.quiet = 1;
    options.seconds = 5;
}

}  // namespace

bool asksForHelp(int count, char** words) {
    return std::any_of(words, words + count,
                       [](std::string_view word) { return word == "--help"; });
}

FleetOptions readOptions(int count, char** words) {
    FleetOptions options;
    options.seed = std::random_device()();
    const Words known{
        {"--processes", whole(options.processes, 200)},
        {"--settings", whole(options.settings, 10'000)},
        {"--members", whole(options.members, 7)},
        {"--writers", whole(options.writers, 200)},
        {"--rate", [&](const auto& text) { options.rate = number(text, 1, 10'000); }},
        {"--quiet", [&](const auto& text) { options.quiet = number(text, 0, 3600); }},
        {"--seconds", [&](const auto& text) { options.seconds = number(text, 0, 3600); }},
        {"--faults", [&](const auto& text) { options.hasFaults = truth(text); }},
        {"--seed",
         [&](const auto& text) {
             options.seed = static_cast<unsigned>(number(text, 0, 4294967295));
         }},
    };
    for (int i = 1; i < count; ++i) {
        const std::string word = words[i];
        if (word == "--short") {
            makeShort(options);
            continue;
        }
        const auto option = known.find(word);
        if (option == known.end()) throw BadOptions("No such option: " + word);
        if (++i == count) throw BadOptions("A value is missing after " + word);
        option->second(words[i]);
    }
    options.writers = std::min(options.writers, options.processes);
    return options;
}

}  // namespace velkor::benchmarks
