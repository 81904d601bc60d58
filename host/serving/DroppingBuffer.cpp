#include "host/serving/DroppingBuffer.hpp"

#include <poll.h>
#include <unistd.h>

#include <algorithm>
#include <climits>
#include <utility>

namespace velkor::host {

namespace {

// A pipe that has room takes that much without waiting.
constexpr std::size_t mostAtOnce = PIPE_BUF;

bool hasRoom(int descriptor) {
    pollfd awaited{descriptor, POLLOUT, 0};
    return ::poll(&awaited, 1, 0) == 1 && (awaited.revents & POLLOUT) != 0;
}

}  // namespace

DroppingBuffer::int_type DroppingBuffer::overflow(int_type byte) {
    if (!traits_type::eq_int_type(byte, traits_type::eof())) {
        record += traits_type::to_char_type(byte);
    }
    return traits_type::not_eof(byte);
}

std::streamsize DroppingBuffer::xsputn(const char* bytes, std::streamsize count) {
    record.append(bytes, static_cast<std::size_t>(count));
    return count;
}

int DroppingBuffer::sync() {
    const std::string text = std::exchange(record, {});
    if (text.empty()) return 0;
    const std::string gap = isLineOpen ? "\n" : "";
    if (dropped != 0 && write(gap + "records dropped since nobody read them in time: " +
                              std::to_string(dropped) + '\n')) {
        dropped = 0;
        isLineOpen = false;
    }
    if (dropped != 0 || !write(text)) ++dropped;
    return 0;
}

// Gives whether all of it was written.
bool DroppingBuffer::write(const std::string& text) {
    std::size_t written = 0;
    while (written < text.size() && hasRoom(target)) {
        const std::size_t count = std::min(mostAtOnce, text.size() - written);
        const ssize_t taken = ::write(target, text.data() + written, count);
        if (taken <= 0) break;
        written += static_cast<std::size_t>(taken);
    }
    if (written != 0) isLineOpen = written < text.size();
    return written == text.size();
}

}  // namespace velkor::host
