#pragma once

#include <fstream>
#include <string>

#include "framework/common/Export.hpp"

namespace velkor::common {

/// A binary input file stream opened from a UTF-16 path.
class VELKOR_EXPORT WidePathInputFileStream : public std::ifstream {
public:
    /// Opens the file at `path`, taken as UTF-8 by the system. As with every file stream a file
    /// that can't be opened leaves the stream closed and failed; so does a path that names a
    /// directory or holds a NUL.
    explicit WidePathInputFileStream(const std::u16string& path);
    ~WidePathInputFileStream() override;
};

}  // namespace velkor::common
