#pragma once

#include <array>
#include <cstddef>
#include <limits>
#include <string>
#include <tuple>
#include <vector>

#include "configuration/ConfigurationValue.hpp"
#include "tests/layers/faults/SimulatedFile.hpp"

namespace velkor::testing {

/// Makes random values of every kind, awkward ones among them.
class RandomValues {
public:
    explicit RandomValues(Random& generator) : random(generator) {}

    /// One of few keys, in groups, of any bytes.
    std::string key() {
        static const std::array<std::string, 8> keys{"a",
                                                     "server.port",
                                                     "server.host",
                                                     "server.tls.key",
                                                     "x.y.z",
                                                     "x.y",
                                                     "Gr\xc3\xb6\xc3\x9f"
                                                     "e",
                                                     "a b=\xff\n'"};
        return keys[below(keys.size(), random)];
    }

    configuration::ConfigurationValue value() {
        configuration::ConfigurationValue made;
        std::size_t kind = below(configuration::typeTags.size(), random);
        configuration::forEachValueKind([&](const auto& row) {
            using Type = typename std::decay_t<decltype(row)>::Type;
            if (kind-- == 0) made = one(static_cast<Type*>(nullptr));
        });
        return made;
    }

private:
    bool one(const bool*) { return below(2, random) == 0; }
    int one(const int*) { return static_cast<int>(random()); }
    unsigned one(const unsigned*) { return static_cast<unsigned>(random()); }

    double one(const double*) {
        using Limits = std::numeric_limits<double>;
        const std::array<double, 6> awkward{
            0.1, -0.0, Limits::infinity(), Limits::max(), Limits::denorm_min(), -1e-300};
        return awkward[below(awkward.size(), random)];
    }

    template <class Character>
    std::basic_string<Character> one(const std::basic_string<Character>*) {
        std::basic_string<Character> text;
        for (std::size_t length = size(); text.size() < length;) {
            text += static_cast<Character>(random());
        }
        return text;
    }

    template <class T>
    std::vector<T> one(const std::vector<T>*) {
        std::vector<T> values;
        for (std::size_t count = below(4, random); values.size() < count;) {
            values.push_back(one(static_cast<T*>(nullptr)));
        }
        return values;
    }

    /// Mostly short, now and then longer than a page of a database.
    std::size_t size() { return below(20, random) == 0 ? 5000 : below(30, random); }

    Random& random;
};

}  // namespace velkor::testing
