#pragma once

#include <memory>
#include <string>
#include <utility>

#include "configuration/Changes.hpp"
#include "configuration/ConfigurationValue.hpp"
#include "configuration/Option.hpp"
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
std::string spelledWatched(const configuration::ConfigurationValue& value);
std::string spelledWatched(const configuration::OptionChange& change);

template <class Texts>
std::string spelledTexts(const Texts& texts) {
    std::string all;
    for (const std::string& text : texts) all += '"' + text + "\" ";
    return all;
}

}  // namespace velkor::fuzz::store
