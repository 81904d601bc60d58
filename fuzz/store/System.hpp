#pragma once

#include <exception>
#include <functional>
#include <memory>
#include <string>
#include <utility>

#include "configuration/ConfigurationValue.hpp"
#include "configuration/Option.hpp"
#include "framework/reactive_streams/Subscriber.hpp"
#include "fuzz/Performer.hpp"
#include "fuzz/store/Step.hpp"

namespace velkor::fuzz::store {

/// A store, or the model of one, with all that it calls.
class System : public Performer<Step> {
public:
    /// A log sink gets a record: notes it, and reacts or throws if it is this one's turn.
    void record(const std::string& message);

    /// Whether the store has not been given up.
    virtual bool hasStore() const noexcept = 0;

    /// Gives up the store and then the publishers that are held, in their order.
    virtual void end() = 0;

protected:
    /// Lets records be written from now on, for the sink to do what `step` says.
    void startRecording(const Step& step) {
        sink = step;
        sinkIsOn = true;
    }
    bool isRecording() const noexcept { return sinkIsOn; }

private:
    Step sink{};
    bool sinkIsOn = false;
};

/// What subscribes to watches, of a store and of a model.
class Watcher final : public reactive_streams::Subscriber<configuration::ConfigurationValue> {
public:
    using Value = configuration::ConfigurationValue;
    using Opened = std::function<void(std::weak_ptr<reactive_streams::Subscription>)>;

    /// The subscriber of the watch `itsNumber`, which does what `watch` says; `keep` takes its
    /// subscription.
    Watcher(System& itsSystem, std::size_t itsNumber, const Step& watch, Opened keep)
        : system(itsSystem), number(itsNumber), step(watch), onOpened(std::move(keep)) {}

    void onSubscribe(std::weak_ptr<reactive_streams::Subscription> subscription) override;
    void onComplete() override;
    void onError(const std::exception_ptr& error) override;

    /// Notes the value, reacts, and throws if it is to.
    using reactive_streams::Subscriber<Value>::onNext;
    void onNext(Value&& value) override;

private:
    void note(const std::string& event) {
        system.note("watcher " + std::to_string(number) + ' ' + event);
    }

    System& system;
    const std::size_t number;
    const Step step;
    const Opened onOpened;
    int reactionsLeft = 3;
};

/// What an own source does beside holding a table, whoever calls it.
struct Temper {
    Mood mood = Mood::willing;
    std::shared_ptr<const Step> reaction{};
    int reactionsLeft = 3;

    /// Throws in the mood `refusing`.
    void require(Mood refusing) const;

    void react(System& system);
};

// How answers are noted.
std::string spelledOption(const configuration::Option& option);
std::string spelledBool(bool answer);

template <class Texts>
std::string spelledTexts(const Texts& texts) {
    std::string all;
    for (const std::string& text : texts) all += '"' + text + "\" ";
    return all;
}

}  // namespace velkor::fuzz::store
