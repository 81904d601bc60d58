#include "framework/common/WidePathInputFileStream.hpp"

#include <filesystem>
#include <system_error>

#include "framework/common/TextConversion.hpp"

namespace velkor::common {

namespace {

bool canNameAFile(const std::string& path) {
    std::error_code notThere;
    return path.find('\0') == std::string::npos && !std::filesystem::is_directory(path, notThere);
}

}  // namespace

WidePathInputFileStream::WidePathInputFileStream(const std::u16string& path) {
    const std::string narrowPath = TextConversion("UTF-8").fromUtf16(path);
    if (canNameAFile(narrowPath)) {
        open(narrowPath, std::ios::binary);
    } else {
        setstate(std::ios::failbit);
    }
}

// Defined here, so that the class has its virtual table in this library only.
WidePathInputFileStream::~WidePathInputFileStream() = default;

}  // namespace velkor::common
