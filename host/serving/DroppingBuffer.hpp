#pragma once

#include <cstddef>
#include <streambuf>
#include <string>

namespace velkor::host {

/// A stream buffer that writes records to a descriptor and waits for no reader: what a pipe or a
/// terminal does not take at once is dropped, so that nobody holds who writes it by not reading.
/// Once there is room again, a line says how many records are missing. A record is what comes
/// between two flushes. One thread at a time.
class DroppingBuffer final : public std::streambuf {
public:
    /// Writes to `descriptor`, which stays its owner's.
    explicit DroppingBuffer(int descriptor) : target(descriptor) {}

protected:
    int_type overflow(int_type byte) override;
    std::streamsize xsputn(const char* bytes, std::streamsize count) override;
    int sync() override;

private:
    bool write(const std::string& text);

    const int target;
    std::string record;
    std::size_t dropped = 0;
    bool isLineOpen = false;  // the one before was cut
};

}  // namespace velkor::host
