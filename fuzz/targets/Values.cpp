// Any bytes as a value in etcd and as a value in a state file: what they are read as is written and
// read again, in both forms, and nothing of it is lost. The form in state files is compared with
// what is documented of it, since files are to be readable for good.

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <string_view>
#include <type_traits>
#include <vector>

#include "configuration/service/ValueJson.hpp"
#include "fuzz/Finding.hpp"
#include "fuzz/Targets.hpp"
#include "fuzz/Values.hpp"
#include "layers/detail/ValueCodec.hpp"
#include "layers/etcd/detail/Base64.hpp"
#include "layers/etcd/detail/ValueText.hpp"
#include "messages/JsonText.hpp"

namespace velkor::fuzz {
namespace {

using configuration::ConfigurationValue;
using layers::detail::decoded;
using layers::detail::encoded;
using layers::etcd::fromValueText;
using layers::etcd::toValueText;

/// Takes the documented form of a value's content off the front of a text, and reports where it
/// finds another one.
class DocumentedForm : public boost::static_visitor<void> {
public:
    explicit DocumentedForm(std::string_view& text) : rest(text) {}

    void operator()(bool content) const { take(content ? "true" : "false"); }
    void operator()(int content) const { take(std::to_string(content)); }
    void operator()(unsigned int content) const { take(std::to_string(content)); }
    void operator()(const std::string& content) const { take(content); }

    // Of the digits of a finite number it is documented that they are enough, and the fewest.
    void operator()(double content) const {
        if (std::isnan(content)) {
            std::uint64_t bits = 0;
            std::memcpy(&bits, &content, sizeof bits);
            char digits[20];
            std::snprintf(digits, sizeof digits, "nan%016llx",
                          static_cast<unsigned long long>(bits));
            return take(digits);
        }
        const std::string number(rest.substr(0, rest.find(',')));
        const double read = std::strtod(number.c_str(), nullptr);
        expectSame("Number " + number, exactly(content), exactly(read));
        take(number);
    }

    void operator()(const std::u16string& content) const {
        std::string bytes;
        for (const char16_t unit : content) {
            bytes += static_cast<char>(unit % 256);
            bytes += static_cast<char>(unit / 256);
        }
        take(bytes);
    }

    template <class T>
    void operator()(const std::vector<T>& content) const {
        for (const T& element : content) {
            if constexpr (std::is_same_v<T, std::string>) {
                take(std::to_string(element.size()) + ':');
            } else if constexpr (std::is_same_v<T, std::u16string>) {
                take(std::to_string(2 * element.size()) + ':');
            }
            (*this)(element);
            take(",");
        }
    }

    void take(std::string_view expected) const {
        expectSameBytes("Form in a file", expected, rest.substr(0, expected.size()));
        rest.remove_prefix(expected.size());
    }

private:
    std::string_view& rest;
};

void checkForms(const ConfigurationValue& value) {
    const std::string bytes = encoded(value);
    std::string_view rest = bytes;
    const DocumentedForm form(rest);
    form.take(configuration::typeTags.at(static_cast<std::size_t>(value.which())));
    form.take(":");
    boost::apply_visitor(form, value);
    expectSameBytes("What follows a value in a file", "", rest);

    const auto fromFile = decoded(bytes);
    expectSame("Read from " + spelled(bytes), exactly(value),
               fromFile ? exactly(*fromFile) : "nothing");
    const std::string text = toValueText(value);
    expectSame("Read from " + spelled(text), exactly(value), exactly(fromValueText(text)));
    expectThat(messages::parseJsonObject(text)->has("type"), "A value in etcd is JSON", text);
}

// Whether so many digits follow each other that they may be a number of more than 64 bits.
bool hasLongNumber(std::string_view text) {
    constexpr std::ptrdiff_t digits = 19;
    const auto isDigit = [](char byte, char) { return byte >= '0' && byte <= '9'; };
    return std::search_n(text.begin(), text.end(), digits, '0', isDigit) != text.end();
}

// What is one of our objects to the letter is one of the more lenient messages as well. Those read
// a lone half of a surrogate pair, and the sign of a whole zero, in another way, and may refuse
// long numbers.
void compareWithMessage(std::string_view input, const ConfigurationValue& value) {
    const bool isPlainText = exactly(value) == exactly(std::string(input));
    if (isPlainText || input.find('\\') != std::string_view::npos || hasLongNumber(input)) return;
    const auto object = messages::parseJsonObject(std::string(input));
    if (object->has("exact")) return;
    ConfigurationValue lenient;
    configuration::readJson(object, lenient);
    if (!(lenient == value))
        report("Read from " + spelled(input), exactly(lenient), exactly(value));
}

void checkBase64(std::string_view input) {
    const std::string text = layers::etcd::toBase64(input);
    expectThat(text.size() == (input.size() + 2) / 3 * 4, "Base64 has four for three", text);
    expectThat(layers::etcd::fromBase64(text) == std::string(input), "Base64 keeps bytes", text);
    const auto bytes = layers::etcd::fromBase64(input);
    if (bytes) expectSame("Base64 has one form", input, layers::etcd::toBase64(*bytes));
}

const Target target("values", [](std::string_view input) {
    const ConfigurationValue fromEtcd = fromValueText(input);
    checkForms(fromEtcd);
    compareWithMessage(input, fromEtcd);
    if (const auto fromFile = decoded(input)) checkForms(*fromFile);
    checkBase64(input);
});

}  // namespace
}  // namespace velkor::fuzz
