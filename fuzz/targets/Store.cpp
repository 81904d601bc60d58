// Operations on a store, with sources, subscribers and log sinks that throw, call back and give
// things up, and on a model of it. Both have to leave the same trace.

#include <iostream>
#include <streambuf>
#include <string>
#include <string_view>

#include "fuzz/Choices.hpp"
#include "fuzz/Finding.hpp"
#include "fuzz/Targets.hpp"
#include "fuzz/store/ModelSystem.hpp"
#include "fuzz/store/RealSystem.hpp"

namespace velkor::fuzz {
namespace {

using store::System;

/// Standard error becomes a part of the trace while this lives.
class ErrorLines : public std::streambuf {
public:
    explicit ErrorLines(System& noting) : system(noting), before(std::cerr.rdbuf(this)) {}
    ~ErrorLines() override { std::cerr.rdbuf(before); }

private:
    int_type overflow(int_type byte) override {
        if (byte == '\n') {
            system.note(line);
            line.clear();
        } else {
            line += traits_type::to_char_type(byte);
        }
        return byte;
    }

    System& system;
    std::streambuf* const before;
    std::string line;
};

const Target target("store", [](std::string_view input) {
    constexpr int mostSteps = 24;
    store::ModelSystem model;
    store::RealSystem real;
    const ErrorLines errors(real);
    expectSameTraces(Choices(input), mostSteps, model, real,
                     [](Choices& choices) { return store::readStep(choices); });
});

}  // namespace
}  // namespace velkor::fuzz
