#pragma once

#include <cstddef>
#include <istream>

#include "host/console/LineSource.hpp"

namespace velkor::host {

/// Lines of a stream, each ended by LF or by the end of the stream. Bytes are taken as they are,
/// NUL included. Memory stays bounded, whatever the stream holds.
class LineReader final : public LineSource {
public:
    /// The longest line that is accepted, in bytes.
    static constexpr std::size_t longestLine = std::size_t{1} << 20U;

    /// Reads `input`, which must live as long.
    explicit LineReader(std::istream& input) : in(input) {}

    /// Throws `LineError` "Line too long; the limit is 1048576 bytes." after it has read to the end
    /// of that line; "Reading failed." when the stream is broken, which then is at its end.
    std::optional<std::string> nextLine() override;

    std::string position() const override;

private:
    std::istream& in;
    std::size_t lineNumber = 0;
};

}  // namespace velkor::host
