#pragma once

#include <string_view>

namespace velkor::http::detail {

/// The document of the page in its pieces, in their order: what stands between them belongs to the
/// pieces, so that style and script are exactly the texts of their elements.
extern const std::string_view pageHead;
extern const std::string_view pageStyle;
extern const std::string_view pageBody;
extern const std::string_view pageScript;
extern const std::string_view pageTail;

}  // namespace velkor::http::detail
