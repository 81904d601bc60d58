#pragma once

#include <ostream>
#include <string>
#include <string_view>

#include "framework/common/Mutex.hpp"
#include "host/console/Colours.hpp"

namespace velkor::host {

/// Where answers and messages go: answers to standard output exactly as they are, messages to
/// standard error as one line each, "velkor-config: " first and control characters escaped.
///
/// Thread-safe: whole texts are written at a time. A stream that fails throws nothing; what comes
/// later for it is dropped. The streams must live as long.
class Output {
public:
    /// Whether answers are shown on a terminal, where control characters of a value must not act.
    /// Some terminals have colours besides.
    enum class Answers { exact, escaped, coloured };

    Output(std::ostream& answerStream, Answers answerForm, std::ostream& messageStream);

    /// Writes `text`, with a line feed where a text that is not empty lacks one at its end. Once
    /// Ctrl-C was pressed, see `Interruption`, what is left of it is dropped; that is no failure.
    /// Where there are colours, each line is painted by `paint`, unless that is null.
    void answer(std::string_view text, Paint paint = nullptr) VELKOR_EXCLUDES(mutex);

    /// Writes one line of what the operator should know.
    void message(std::string_view text) VELKOR_EXCLUDES(mutex);

    /// Whether answers still arrive. False once a write has failed: the reader has gone away.
    bool isOpen() const VELKOR_EXCLUDES(mutex);

    /// Why answers no longer arrive, as an `errno`; 0 while they do.
    int failure() const VELKOR_EXCLUDES(mutex);

private:
    mutable common::Mutex mutex;
    std::ostream& answers VELKOR_GUARDED_BY(mutex);
    std::ostream& messages VELKOR_GUARDED_BY(mutex);
    const Answers form;
    int error VELKOR_GUARDED_BY(mutex) = 0;
};

}  // namespace velkor::host
