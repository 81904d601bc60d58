#pragma once

#include <cstddef>
#include <memory>
#include <string>
#include <vector>

#include "configuration/ConfigurationValue.hpp"
#include "fuzz/Choices.hpp"

namespace velkor::fuzz::settings {

struct Step;

/// What a callback does beside being noted.
struct Manner {
    bool throws = false;
    std::shared_ptr<const Step> reaction{};
};

inline constexpr std::size_t slots = 3;      ///< Of settings, each of which has two callbacks.
inline constexpr std::size_t overrides = 2;  ///< That may be there at a time.
inline constexpr std::size_t kinds = 8;      ///< Of settings, see `Kinds.hpp`.

/// One thing that is done:
///
///     s d  sets a key, in "override" or in "default"   u  takes it out of "override"
///     y    sets both keys together                     o q  begins and ends an override
///     n e  makes and ends a setting                    c h  adds and ends one of its callbacks
///     t    asks for value and status                   k  asks whether a key is secret
///     m    says how a callback behaves from now on     D  gives the store up
struct Step {
    char operation = 's';
    std::size_t slot = 0;
    std::size_t kind = 0;
    std::size_t number = 0;  ///< Of the callback, or of the override.
    std::string key{};
    configuration::ConfigurationValue value{};
    configuration::ConfigurationValue other{};
    Manner manner{};
};

/// The step that comes next; reactions of callbacks may be `depth` deep.
Step readStep(Choices& choices, int depth = 2);

}  // namespace velkor::fuzz::settings
