// Operations on settings, structs and overrides, with callbacks that throw, act and end what they
// are called by, over a store whose values change with any type, and on a model of them. Both have
// to leave the same trace.

#include <string_view>

#include "fuzz/Performer.hpp"
#include "fuzz/Targets.hpp"
#include "fuzz/settings/ModelSettings.hpp"
#include "fuzz/settings/RealSettings.hpp"
#include "fuzz/settings/Step.hpp"

namespace velkor::fuzz {
namespace {

const Target target("settings", [](std::string_view input) {
    constexpr int mostSteps = 30;
    settings::ModelSettings model;
    settings::RealSettings real;
    expectSameTraces(Choices(input), mostSteps, model, real,
                     [](Choices& choices) { return settings::readStep(choices); });
});

}  // namespace
}  // namespace velkor::fuzz
