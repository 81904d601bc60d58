#include "fuzz/store/System.hpp"

#include <exception>
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

void Watcher::onSubscribe(std::weak_ptr<reactive_streams::Subscription> subscription) {
    onOpened(std::move(subscription));
    note("subscribed");
    Step request;
    request.operation = 'q';
    request.number = number;
    request.demand = step.demand;
    system.perform(request);
}

void Watcher::onComplete() {
    note("completed");
}

void Watcher::onError(const std::exception_ptr& /*error*/) {
    note("failed");
}

void Watcher::onNext(Value&& value) {
    note("gets " + exactly(value));
    const bool throws = step.throws;
    if (step.reaction != nullptr && reactionsLeft > 0) {
        --reactionsLeft;
        // Which may be the end of this.
        const auto reaction = step.reaction;
        system.perform(*reaction);
    }
    if (throws) throw std::runtime_error("a subscriber");
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

std::string spelledBool(bool answer) {
    return answer ? "true" : "false";
}

}  // namespace velkor::fuzz::store
