#include "framework/common/TextConversion.hpp"

#include <boost/locale/utf.hpp>
#include <iterator>
#include <stdexcept>

namespace velkor::common {

namespace {

namespace utf = boost::locale::utf;

constexpr utf::code_point replacementCharacter = 0xFFFD;

// The decoder also consumes the unit at which it noticed that a sequence is broken. That unit may
// begin the next character, so decoding goes on there; after a complete but forbidden sequence
// (overlong, surrogate, out of range) it goes on behind the first unit.
template <class Char>
const Char* resumeAfterIllegal(const Char* start, const Char* stopped) {
    const bool brokenByNextUnit =
        stopped - start > 1 && !utf::utf_traits<Char>::is_trail(*std::prev(stopped));
    return brokenByNextUnit ? std::prev(stopped) : std::next(start);
}

template <class To, class From>
std::basic_string<To> convert(const std::basic_string<From>& text) {
    std::basic_string<To> converted;
    converted.reserve(text.size());
    const From* position = text.data();
    const From* const end = position + text.size();
    while (position != end) {
        const From* const start = position;
        utf::code_point decoded = utf::utf_traits<From>::decode(position, end);
        if (decoded == utf::illegal) position = resumeAfterIllegal(start, position);
        if (decoded == utf::illegal || decoded == utf::incomplete) decoded = replacementCharacter;
        utf::utf_traits<To>::encode(decoded, std::back_inserter(converted));
    }
    return converted;
}

}  // namespace

TextConversion::TextConversion(const std::string& codec) {
    if (codec != "UTF-8") throw std::invalid_argument("Unknown text codec: " + codec);
}

std::string TextConversion::fromUtf16(const std::u16string& text) const {
    return convert<char>(text);
}

std::u16string TextConversion::toUtf16(const std::string& text) const {
    return convert<char16_t>(text);
}

}  // namespace velkor::common
