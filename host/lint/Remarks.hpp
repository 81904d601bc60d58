#pragma once

#include <cstddef>
#include <string>

#include "configuration/sources/PropertyFileLint.hpp"

namespace velkor::host {

/// `remark` on the file at `path` as one line, "PATH:LINE:COLUMN: TEXT".
std::string remarkText(const std::string& path, const configuration::PropertyRemark& remark);

/// How many remarks there are on `text`, the content of a property file.
std::size_t countRemarks(const std::string& text);

/// What is said where a file with so many remarks is read: "PATH: 2 remarks, see check".
std::string remarksNotice(const std::string& path, std::size_t count);

/// "1 remark", "2 remarks".
std::string remarksText(std::size_t count);

}  // namespace velkor::host
