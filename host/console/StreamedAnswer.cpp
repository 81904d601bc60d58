#include "host/console/StreamedAnswer.hpp"

#include <cstddef>

#include "host/console/Interruption.hpp"

namespace velkor::host {

void StreamedAnswer::line(std::string_view text) {
    constexpr std::size_t blockSize = std::size_t{1} << 16U;
    pending.append(text) += '\n';
    if (hasBegun && pending.size() < blockSize) return;
    hasBegun = true;
    flush();
    if (Interruption::isRequested() || !output.isOpen()) throw Interrupted();
}

void StreamedAnswer::note(std::string_view text) {
    flush();
    output.message(text);
}

void StreamedAnswer::flush() {
    output.answer(pending, paint);
    pending.clear();
}

}  // namespace velkor::host
