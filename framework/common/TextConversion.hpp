#pragma once

#include <string>

#include "framework/common/Export.hpp"

namespace velkor::common {

/// Converts between UTF-16 text and a narrow encoding. Immutable, so safe for concurrent use.
///
/// Content never makes a conversion fail: an ill-formed sequence becomes U+FFFD and what stands
/// beside it is kept. A leading U+FEFF is content.
class VELKOR_EXPORT TextConversion {
public:
    /// A converter for the narrow encoding `codec`, which is "UTF-8". Any other name throws
    /// `std::invalid_argument` "Unknown text codec: " followed by the name.
    explicit TextConversion(const std::string& codec);

    /// `text` in the narrow encoding. A lone surrogate becomes one U+FFFD.
    std::string fromUtf16(const std::u16string& text) const;

    /// The narrow `text` in UTF-16.
    std::u16string toUtf16(const std::string& text) const;
};

}  // namespace velkor::common
