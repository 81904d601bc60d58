#pragma once

#include <string>

namespace velkor::host {

/// Who runs this process: the login name of its user; where the system knows none, what LOGNAME
/// says, and else the number of the user.
std::string loginName();

}  // namespace velkor::host
