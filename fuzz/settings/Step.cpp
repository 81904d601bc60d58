#include "fuzz/settings/Step.hpp"

#include <string_view>

namespace velkor::fuzz::settings {

namespace {

using configuration::ConfigurationValue;

ConfigurationValue readValue(Choices& choices) {
    static const std::vector<ConfigurationValue> values{
        2,
        4,
        5,
        9,
        true,
        2.0,
        7U,
        std::string("1"),
        std::string("x"),
        std::string(),
        std::vector<int>{1, 2},
        std::u16string(u"3"),
    };
    // Behind the digits come letters.
    return values[choices.below(values.size())];
}

bool isAbout(const Step& step, std::string_view operations) {
    return operations.find(step.operation) != std::string_view::npos;
}

}  // namespace

Step readStep(Choices& choices, int depth) {
    Step step;
    step.operation = choices.oneOf("ssdunnceohqtykmD");
    if (isAbout(step, "nechtm")) step.slot = choices.below(slots);
    if (isAbout(step, "n")) step.kind = choices.below(kinds);
    if (isAbout(step, "chm")) step.number = choices.below(2);
    if (isAbout(step, "oq")) step.number = choices.below(overrides);
    if (isAbout(step, "sduonk")) step.key = choices.oneOf("ab");
    if (isAbout(step, "sdoy")) step.value = readValue(choices);
    if (isAbout(step, "y")) step.other = readValue(choices);
    if (!isAbout(step, "m")) return step;
    step.manner.throws = choices.isOdd();
    if (depth > 0 && choices.isOdd()) {
        step.manner.reaction = std::make_shared<const Step>(readStep(choices, depth - 1));
    }
    return step;
}

}  // namespace velkor::fuzz::settings
