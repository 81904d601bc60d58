#pragma once

#include <streambuf>

namespace velkor::host {

/// Writes to a file descriptor at once, without a buffer, and gives up on Ctrl-C: an output that
/// fails has left the reason in `errno`, EINTR when it was interrupted. The descriptor belongs to
/// somebody else.
class DescriptorBuffer final : public std::streambuf {
public:
    explicit DescriptorBuffer(int fileDescriptor) : descriptor(fileDescriptor) {}

protected:
    std::streamsize xsputn(const char* text, std::streamsize size) override;
    int_type overflow(int_type byte) override;

private:
    const int descriptor;
};

}  // namespace velkor::host
