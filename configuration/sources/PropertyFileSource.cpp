#include "configuration/sources/PropertyFileSource.hpp"

#include <algorithm>
#include <array>
#include <cstddef>
#include <istream>
#include <locale>
#include <stdexcept>
#include <string_view>

#include "configuration/StoreErrors.hpp"
#include "configuration/sources/PropertyFileParser.hpp"
#include "framework/common/TextConversion.hpp"
#include "framework/common/WidePathInputFileStream.hpp"

namespace velkor::configuration {

namespace {

// Everything up to the end of the file or to the first byte that can't be read: `peek` fills the
// stream's buffer, and `readsome` takes what is in it, so that an error costs no byte before it.
std::string readAll(std::istream& file) {
    std::string text;
    constexpr std::size_t blockSize = 8192;
    std::array<char, blockSize> block;
    while (file.peek() != std::istream::traits_type::eof()) {
        const std::streamsize size = file.readsome(block.data(), block.size());
        text.append(block.data(), static_cast<std::size_t>(size));
    }
    return text;
}

ValueMap parseProperties(std::string_view text) {
    ValueMap properties;
    // A table that need not grow is filled half again as fast. Most lines hold one property; the
    // limit keeps a file of nothing but line breaks from taking more memory than its own size.
    constexpr std::ptrdiff_t usualProperty = 16;
    const auto lines = std::count(text.begin(), text.end(), '\n');
    const auto most = static_cast<std::ptrdiff_t>(text.size()) / usualProperty;
    properties.reserve(static_cast<std::size_t>(std::min(lines, most)));
    PropertyFileParser(text, properties).parse();
    return properties;
}

ValueMap readProperties(const std::u16string& path) {
    common::WidePathInputFileStream file(path);
    if (!file) {
        throw std::runtime_error(store_errors::fileNotOpened +
                                 common::TextConversion("UTF-8").fromUtf16(path));
    }
    // A stream begins with the host's locale, which may convert what is read.
    file.imbue(std::locale::classic());
    return parseProperties(readAll(file));
}

}  // namespace

PropertyFileSource::PropertyFileSource(const std::u16string& path)
    : TableSource(typeid(PropertyFileSource), readProperties(path), Origin::thisLibrary) {}

PropertyFileSource::PropertyFileSource(PropertyText text)
    : TableSource(typeid(PropertyFileSource), parseProperties(text.content), Origin::thisLibrary) {}

ConfigurationValue PropertyFileSource::set(const std::string&, ConfigurationValue) {
    throw std::runtime_error(store_errors::writingNotSupported);
}

}  // namespace velkor::configuration
