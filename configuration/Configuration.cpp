#include "configuration/Configuration.hpp"

#include <stdexcept>

#include "configuration/StoreErrors.hpp"
#include "framework/common/TextConversion.hpp"

namespace velkor::configuration {

Configuration::~Configuration() = default;

std::string Configuration::narrowText(const char* text) {
    if (text == nullptr) throw std::invalid_argument(store_errors::nullText);
    return text;
}

std::u16string Configuration::wideText(const std::filesystem::path& path) {
    return common::TextConversion("UTF-8").toUtf16(path.native());
}

}  // namespace velkor::configuration
