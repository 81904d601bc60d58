#include "host/console/DescriptorBuffer.hpp"

#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstddef>

#include "host/console/Interruption.hpp"

namespace velkor::host {

namespace {

// Written at a time. Ctrl-C is noticed between two pieces also where it came too early to interrupt
// the system call.
constexpr std::streamsize pieceSize = 16384;

}  // namespace

std::streamsize DescriptorBuffer::xsputn(const char* text, std::streamsize size) {
    std::streamsize done = 0;
    while (done < size) {
        if (Interruption::isRequested()) {
            errno = EINTR;
            break;
        }
        const auto piece = static_cast<std::size_t>(std::min(size - done, pieceSize));
        const ssize_t count = ::write(descriptor, text + done, piece);
        if (count >= 0) done += count;
        if (count < 0 && errno != EINTR) break;
    }
    return done;
}

DescriptorBuffer::int_type DescriptorBuffer::overflow(int_type byte) {
    if (traits_type::eq_int_type(byte, traits_type::eof())) return traits_type::not_eof(byte);
    const char text = traits_type::to_char_type(byte);
    return xsputn(&text, 1) == 1 ? byte : traits_type::eof();
}

}  // namespace velkor::host
