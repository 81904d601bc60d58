#pragma once

#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace velkor::http::detail {

/// The page that shows the store in a browser: one HTML document in UTF-8 that needs nothing else
/// but the routes beside it. Lives as long as the program. Any thread.
std::string_view pageHtml();

/// The page's Content-Security-Policy: its own style and script, by their digests, and requests to
/// where it came from. Any thread; the first call computes it and may throw `std::bad_alloc`.
const std::string& pagePolicy();

/// All headers that the page is sent with besides those of every answer.
const std::vector<std::pair<std::string, std::string>>& pageHeaders();

}  // namespace velkor::http::detail
