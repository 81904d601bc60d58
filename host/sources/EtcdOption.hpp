#pragma once

#include <string>

#include "host/sources/SourceRequest.hpp"

namespace velkor::host {

/// Understands URL[,URL...][,SETTING...] in any order. With last-known=FILE the layer
/// begins with the values of that file where there is no server, unless without-server says
/// otherwise.
///
/// Throws `UsageError` "--etcd URL: " with the first URL and the reason; without the URL when there
/// is none, or when one may hold a password. No text shows the value of a setting that isn't known.
SourceRequest parseEtcd(const std::string& text);

}  // namespace velkor::host
