#pragma once

#include <array>
#include <stdexcept>
#include <string>

#include "fuzz/Performer.hpp"
#include "fuzz/settings/Step.hpp"

namespace velkor::fuzz::settings {

/// Settings and the store that they follow, real or model, with all that they call.
class System : public Performer<Step> {
public:
    /// Ends everything.
    virtual void end() = 0;

protected:
    /// Called by callback `number` of the setting in `slot`, when `before` has become `now`.
    void call(std::size_t slot, std::size_t number, const std::string& before,
              const std::string& now) {
        note(std::to_string(slot) + '.' + std::to_string(number) + ": " + before + " is now " +
             now);
        const Manner manner = manners.at(slot).at(number);
        if (manner.reaction && reactionsLeft > 0) {
            --reactionsLeft;
            perform(*manner.reaction);
        }
        if (manner.throws) throw std::runtime_error("thrown by a callback");
    }

    void setManner(const Step& step) { manners.at(step.slot).at(step.number) = step.manner; }

private:
    std::array<std::array<Manner, 2>, slots> manners{};
    int reactionsLeft = 12;
};

/// "VALUE from SOURCE", with what is wrong.
inline std::string spelledStatus(const std::string& value, const std::string& source) {
    return value + " from " + (source.empty() ? "default value" : source);
}

}  // namespace velkor::fuzz::settings
