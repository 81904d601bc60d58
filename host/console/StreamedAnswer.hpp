#pragma once

#include <string>
#include <string_view>

#include "host/console/Colours.hpp"
#include "host/console/Command.hpp"
#include "host/console/Output.hpp"

namespace velkor::host {

/// An answer that is shown while it is made: its first line at once, what follows in blocks. What
/// is not flushed is dropped.
class StreamedAnswer final : public CommandOutput {
public:
    /// Writes to `shownIn`, which must live as long. Where there are colours, each line is painted
    /// by `linePaint`, unless that is null.
    explicit StreamedAnswer(Output& shownIn, Paint linePaint = nullptr)
        : output(shownIn), paint(linePaint) {}

    void line(std::string_view text) override;
    void note(std::string_view text) override;

    /// Shows what is left.
    void flush();

private:
    Output& output;
    const Paint paint;
    std::string pending;
    bool hasBegun = false;
};

}  // namespace velkor::host
