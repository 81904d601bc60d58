#include "fuzz/store/Step.hpp"

#include <limits>
#include <string_view>

namespace velkor::fuzz::store {

namespace {

using configuration::Change;
using configuration::ConfigurationValue;
using configuration::ValueMap;

const std::vector<std::string> keys{"a", "b", "g.a", "g.b", "g.h.a", "h.a", "", ".a", "g."};
const std::vector<std::string> relativeKeys{"a", "b", "h.a", ""};
const std::vector<std::string> names{"override", "default", "s", "t", "u"};
const std::vector<std::string> groups{"", "g", "g.", "h", "g.h", "."};
const std::vector<int> orders{0, 5, -1, std::numeric_limits<int>::max(),
                              std::numeric_limits<int>::min()};
const std::vector<std::uint64_t> demands{0, 1, 2, 3, std::numeric_limits<std::uint64_t>::max()};

ConfigurationValue readValue(Choices& choices) {
    const auto number = static_cast<int>(choices.below(10));
    if (number < 8) return number;
    return std::string(number == 8 ? "text" : "");
}

ValueMap readValues(Choices& choices) {
    ValueMap values;
    const std::size_t present = choices.below(16);
    for (std::size_t i = 0; i < relativeKeys.size(); ++i) {
        if ((present >> i & 1U) != 0) values[relativeKeys[i]] = std::string("of a source");
    }
    return values;
}

std::shared_ptr<const Step> readReaction(Choices& choices, int depth) {
    if (depth == 0 || !choices.isOdd()) return nullptr;
    return std::make_shared<const Step>(readStep(choices, depth - 1));
}

Change readChange(Choices& choices) {
    Change change{choices.oneOf(keys)};
    const std::size_t kind = choices.below(4);
    if (kind % 2 == 0) change.value = readValue(choices);
    if (kind >= 2) change.source = choices.oneOf(names);
    return change;
}

void readSource(Choices& choices, Step& step) {
    step.name = choices.oneOf(names);
    step.group = choices.oneOf(groups);
    step.order = choices.oneOf(orders);
    step.flag = choices.isOdd();
}

void readArguments(Choices& choices, int depth, Step& step) {
    switch (step.operation) {
        case 's':
        case 'S':
            step.key = choices.oneOf(keys);
            step.value = readValue(choices);
            if (step.operation == 'S') step.name = choices.oneOf(names);
            return;
        case 'U':
            step.key = choices.oneOf(keys);
            step.name = choices.oneOf(names);
            return;
        case 'a':
            step.changes.resize(choices.below(4));
            step.flag = choices.isOdd();
            for (Change& change : step.changes) change = readChange(choices);
            return;
        case 'n':
            step.keys.resize(choices.below(4));
            for (std::string& key : step.keys) key = choices.oneOf(keys);
            return;
        case 'm':
        case 'p':
            readSource(choices, step);
            step.values = readValues(choices);
            return;
        case 'c':
            readSource(choices, step);
            step.number = choices.below(ownSources);
            return;
        case 'r':
            step.name = choices.oneOf(names);
            return;
        case 't':
            step.number = choices.below(ownSources);
            step.mood = static_cast<Mood>(choices.below(6));
            step.reaction = readReaction(choices, depth);
            return;
        case 'i':
            step.number = choices.below(ownSources);
            step.key = choices.oneOf(relativeKeys);
            step.value = readValue(choices);
            return;
        case 'w':
        case 'W':
            step.key = choices.oneOf(keys);
            step.demand = choices.oneOf(demands);
            step.throws = choices.isOdd();
            step.flag = choices.isOdd();
            step.reaction = readReaction(choices, depth);
            return;
        case 'b':
        case 'x':
        case 'v':
        case 'B':
        case 'X':
        case 'V':
            step.number = choices.below(10);
            return;
        case 'q':
        case 'Q':
            step.number = choices.below(10);
            step.demand = choices.oneOf(demands);
            return;
        case 'l':
            step.number = choices.below(10);
            step.throws = choices.isOdd();
            step.reaction = readReaction(choices, depth);
            return;
        case 'k':
        case 'd':
        case 'D':
            return;
        default:
            step.key = choices.oneOf(keys);
    }
}

}  // namespace

Step readStep(Choices& choices, int depth) {
    constexpr std::string_view operations = "gohekdfnsSuUampcrtiwbqxvWBQXVlD";
    Step step;
    step.operation = choices.oneOf(operations);
    readArguments(choices, depth, step);
    return step;
}

}  // namespace velkor::fuzz::store
