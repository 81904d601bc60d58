#pragma once

#include <chrono>
#include <cstdint>
#include <exception>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "framework/reactive_streams/Publisher.hpp"
#include "tests/support/RecordingSubscriber.hpp"

namespace velkor::reactive_streams {

/// A new stream of numbers and the ways in which its owner drives it. Serves one subscriber and
/// keeps at least eight undelivered values.
struct StreamUnderTest {
    std::shared_ptr<PublisherAPI<int>> publisher;
    std::function<void(int)> publish;
    std::function<void()> complete;
    std::function<void(const std::exception_ptr&)> fail;
};

/// Makes the streams that the rules are checked against.
struct StreamFactory {
    std::function<StreamUnderTest()> make;
    /// How long a call on another thread may take until it counts as one that hangs.
    std::chrono::milliseconds patience;
};

/// One stream with one subscriber under examination by one rule.
class Examination {
public:
    explicit Examination(const StreamFactory& factory);

    /// Subscribes and asks for `demand` values.
    void subscribe(std::uint64_t demand);

    /// Publishes the numbers from `first` to `last`.
    void publish(int first, int last);

    /// Objects unless the claim holds. The first objection counts.
    void require(bool holds, const std::string& claim);

    /// Whether another thread gets through with `call`.
    bool completesElsewhere(std::function<void()> call) const;

    StreamUnderTest stream;
    std::shared_ptr<velkor::testing::RecordingSubscriber<int>> subscriber;
    std::string objection;  // empty while the rule holds

private:
    std::chrono::milliseconds patience;
};

/// A rule that publishers keep to, with the number that the public Reactive Streams document
/// (version 1.0.4) gives it.
struct PublisherRule {
    const char* number;
    const char* name;
    void (*check)(Examination&);
};

/// All rules that can be checked from outside a publisher and its subscription.
const std::vector<PublisherRule>& publisherRules();

/// Checks one rule against a new stream and says what is wrong; empty when the rule holds.
std::string objectionTo(const PublisherRule& rule, const StreamFactory& factory);

}  // namespace velkor::reactive_streams
