// The entry of libFuzzer into a program with one target.

#include <cstddef>
#include <cstdint>
#include <string_view>

#include "fuzz/Targets.hpp"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    // A char may look at any object.
    const auto* const text = reinterpret_cast<const char*>(data);
    (*velkor::fuzz::targets().front())(std::string_view(text, size));
    return 0;
}
