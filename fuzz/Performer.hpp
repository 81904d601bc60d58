#pragma once

#include <exception>
#include <string>
#include <utility>

#include "fuzz/Choices.hpp"
#include "fuzz/Finding.hpp"

namespace velkor::fuzz {

/// What steps are carried out on: a part of the system, or the model of it, with all that it calls.
/// Both are told the same steps, and have to leave the same trace of answers and calls.
template <class Step>
class Performer {
public:
    virtual ~Performer() = default;

    Performer(const Performer&) = delete;
    Performer& operator=(const Performer&) = delete;

    /// Carries out `step` and notes the answer. Called by callbacks as well: the steps of one input
    /// are limited, so that callbacks that call for each other come to an end.
    void perform(const Step& step) {
        if (stepsLeft == 0) return;
        --stepsLeft;
        std::string answer;
        try {
            answer = carryOut(step);
        } catch (const std::exception& error) {
            answer = std::string("throws ") + error.what();
        }
        note(std::string(1, step.operation) + ": " + answer);
    }

    /// Adds a line to the trace.
    void note(const std::string& line) { lines += line + '\n'; }

    /// The trace since this was called last.
    std::string takeTrace() { return std::exchange(lines, {}); }

protected:
    Performer() = default;

    /// Carries out a step, and gives the answer; what is thrown is noted by the caller.
    virtual std::string carryOut(const Step& step) = 0;

private:
    std::string lines;
    int stepsLeft = 60;
};

/// Has `model` and `real` perform the steps that `read` makes of `choices`, at most so many, and
/// end. Their traces have to be the same after each step, and after the end.
template <class Model, class Real, class Read>
void expectSameTraces(Choices choices, int mostSteps, Model& model, Real& real, Read read) {
    const auto compare = [&] {
        const std::string expected = model.takeTrace();
        const std::string actual = real.takeTrace();
        if (expected != actual) report("Trace of " + spelled(choices.input()), expected, actual);
    };
    for (int i = 0; i < mostSteps && !choices.empty(); ++i) {
        const auto step = read(choices);
        model.perform(step);
        real.perform(step);
        compare();
    }
    model.end();
    real.end();
    compare();
}

}  // namespace velkor::fuzz
