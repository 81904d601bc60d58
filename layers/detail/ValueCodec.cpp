#include "layers/detail/ValueCodec.hpp"

#include <array>
#include <charconv>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <type_traits>
#include <utility>
#include <vector>

namespace velkor::layers::detail {

namespace {

using configuration::ConfigurationValue;

constexpr std::string_view trueText = "true";
constexpr std::string_view falseText = "false";
constexpr std::string_view notANumber = "nan";
constexpr std::size_t bitDigits = 16;

template <class T>
inline constexpr bool isText = std::is_same_v<T, std::string> || std::is_same_v<T, std::u16string>;

/// Writes the content of a value behind its tag.
class Encoder : public boost::static_visitor<void> {
public:
    explicit Encoder(std::string& target) : bytes(target) {}

    void operator()(bool value) const { bytes += value ? trueText : falseText; }
    void operator()(int value) const { number(value); }
    void operator()(unsigned int value) const { number(value); }

    void operator()(double value) const {
        if (!std::isnan(value)) return number(value);
        std::uint64_t bits = 0;
        std::memcpy(&bits, &value, sizeof bits);
        std::array<char, bitDigits> digits{};  // all are used: the exponent's bits are set
        bytes += notANumber;
        bytes.append(digits.begin(), std::to_chars(digits.begin(), digits.end(), bits, 16).ptr);
    }

    void operator()(const std::string& text) const { bytes += text; }

    void operator()(const std::u16string& text) const {
        for (const char16_t unit : text) {
            bytes += static_cast<char>(unit & 0xFF);
            bytes += static_cast<char>(unit >> 8);
        }
    }

    template <class T>
    void operator()(const std::vector<T>& items) const {
        for (const T& item : items) {
            if constexpr (isText<T>) {
                number(item.size() * sizeof(typename T::value_type));
                bytes += ':';
            }
            (*this)(item);
            bytes += ',';
        }
    }

private:
    template <class Number>
    void number(Number value) const {
        std::array<char, 32> digits{};
        bytes.append(digits.begin(), std::to_chars(digits.begin(), digits.end(), value).ptr);
    }

    std::string& bytes;
};

template <class Number, class... Form>
bool readNumber(std::string_view text, Number& number, Form... form) {
    const char* const end = text.data() + text.size();
    const auto read = std::from_chars(text.data(), end, number, form...);
    return read.ec == std::errc() && read.ptr == end;
}

bool read(std::string_view content, bool& value) {
    value = content == trueText;
    return value || content == falseText;
}

bool read(std::string_view content, int& value) {
    return readNumber(content, value);
}

bool read(std::string_view content, unsigned int& value) {
    return readNumber(content, value);
}

bool read(std::string_view content, double& value) {
    if (content.substr(0, notANumber.size()) != notANumber) return readNumber(content, value);
    content.remove_prefix(notANumber.size());
    std::uint64_t bits = 0;
    if (content.size() != bitDigits || !readNumber(content, bits, 16)) return false;
    std::memcpy(&value, &bits, sizeof value);
    return std::isnan(value);
}

bool read(std::string_view content, std::string& value) {
    value = content;
    return true;
}

bool read(std::string_view content, std::u16string& value) {
    if (content.size() % 2 != 0) return false;
    value.reserve(content.size() / 2);
    for (std::size_t i = 0; i < content.size(); i += 2) {
        const auto low = static_cast<unsigned char>(content[i]);
        const auto high = static_cast<unsigned char>(content[i + 1]);
        value += static_cast<char16_t>(high << 8 | low);
    }
    return true;
}

/// Takes what stands before the next `separator` off the front of `rest`.
std::optional<std::string_view> takeUntil(char separator, std::string_view& rest) {
    const std::size_t end = rest.find(separator);
    if (end == std::string_view::npos) return std::nullopt;
    const std::string_view taken = rest.substr(0, end);
    rest.remove_prefix(end + 1);
    return taken;
}

/// Takes an item whose size stands in front of it off the front of `rest`.
std::optional<std::string_view> takeSized(std::string_view& rest) {
    const auto digits = takeUntil(':', rest);
    std::size_t size = 0;
    if (!digits || !readNumber(*digits, size)) return std::nullopt;
    if (size >= rest.size() || rest[size] != ',') return std::nullopt;
    const std::string_view taken = rest.substr(0, size);
    rest.remove_prefix(size + 1);
    return taken;
}

template <class T>
bool read(std::string_view content, std::vector<T>& items) {
    while (!content.empty()) {
        const auto item = isText<T> ? takeSized(content) : takeUntil(',', content);
        T value{};
        if (!item || !read(*item, value)) return false;
        items.push_back(std::move(value));
    }
    return true;
}

}  // namespace

std::string encoded(const ConfigurationValue& value) {
    std::string bytes(configuration::typeTags.at(static_cast<std::size_t>(value.which())));
    bytes += ':';
    boost::apply_visitor(Encoder(bytes), value);
    return bytes;
}

std::optional<ConfigurationValue> decoded(std::string_view bytes) {
    std::optional<ConfigurationValue> value;
    const auto tag = takeUntil(':', bytes);
    if (!tag) return value;
    configuration::forEachValueKind([&](const auto& kind) {
        if (kind.tag != *tag) return;
        typename std::decay_t<decltype(kind)>::Type content{};
        if (read(bytes, content)) value = std::move(content);
    });
    return value;
}

}  // namespace velkor::layers::detail
