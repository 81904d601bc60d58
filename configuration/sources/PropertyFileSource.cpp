#include "configuration/sources/PropertyFileSource.hpp"

#include <array>
#include <cstddef>
#include <istream>
#include <locale>
#include <stdexcept>
#include <utility>

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

TextTable readProperties(const std::u16string& path) {
    common::WidePathInputFileStream file(path);
    if (!file) {
        throw std::runtime_error(store_errors::fileNotOpened +
                                 common::TextConversion("UTF-8").fromUtf16(path));
    }
    // A stream begins with the host's locale, which may convert what is read.
    file.imbue(std::locale::classic());
    return PropertyFileParser(readAll(file)).parse();
}

}  // namespace

PropertyFileSource::PropertyFileSource(const std::u16string& path)
    : properties(readProperties(path)) {}

PropertyFileSource::PropertyFileSource(PropertyText text)
    : properties(PropertyFileParser(std::string(text.content)).parse()) {}

PropertyFileSource::~PropertyFileSource() = default;

ConfigurationValue PropertyFileSource::get(const std::string& key) {
    return std::string(properties.at(key));
}

ConfigurationValue PropertyFileSource::set(const std::string&, ConfigurationValue) {
    throw std::runtime_error(store_errors::writingNotSupported);
}

bool PropertyFileSource::has(const std::string& key) {
    return properties.find(key) != nullptr;
}

void PropertyFileSource::setChangeListener(ChangeListener newListener) {
    listener.swap(newListener);
}

std::set<std::string> PropertyFileSource::keys() {
    return properties.keys();
}

}  // namespace velkor::configuration
