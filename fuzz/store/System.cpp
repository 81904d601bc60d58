#include "fuzz/store/System.hpp"

#include <stdexcept>
#include <utility>

#include "fuzz/Values.hpp"

namespace velkor::fuzz::store {

void System::record(const std::string& message) {
    note("record " + message);
    if (sink.number == 0 || --sink.number > 0) return;
    const bool throws = sink.throws;
    if (const auto reaction = sink.reaction) perform(*reaction);
    if (throws) throw std::runtime_error("a log sink");
}

void Temper::require(Mood refusing) const {
    if (mood == refusing) throw std::runtime_error("an own source");
}

void Temper::react(System& system) {
    if (reaction == nullptr || reactionsLeft == 0) return;
    --reactionsLeft;
    const auto kept = reaction;  // which may be replaced meanwhile
    system.perform(*kept);
}

std::string spelledOption(const configuration::Option& option) {
    return option.key + " from " + option.source + ": " + exactly(option.value);
}

std::string spelledWatched(const configuration::ConfigurationValue& value) {
    return exactly(value);
}

std::string spelledWatched(const configuration::OptionChange& change) {
    return change.key + ": " + (change.option ? spelledOption(*change.option) : "nothing");
}

std::string spelledBool(bool answer) {
    return answer ? "true" : "false";
}

}  // namespace velkor::fuzz::store
