#include "configuration/admin/TypedText.hpp"

#include <stdexcept>

#include <locale.h>

namespace velkor::configuration {

namespace {

// The calling thread reads numbers as the C locale writes them while this lives, whatever the host
// has set.
class ScopedCLocale {
public:
    ScopedCLocale() : previous(uselocale(cLocale())) {}
    ~ScopedCLocale() { uselocale(previous); }

    ScopedCLocale(const ScopedCLocale&) = delete;
    ScopedCLocale& operator=(const ScopedCLocale&) = delete;

private:
    static locale_t cLocale() {
        struct Owner {
            locale_t locale = newlocale(LC_ALL_MASK, "C", nullptr);
            ~Owner() { freelocale(locale); }
        };
        static const Owner owner;
        return owner.locale;
    }

    locale_t previous;
};

ConfigurationValue parseNumber(const std::string& text) {
    const ScopedCLocale cLocale;
    if (text.find('.') != std::string::npos) return std::stod(text);
    return std::stoi(text);
}

}  // namespace

ConfigurationValue typedText(const std::string& text) {
    if (text == "true" || text == "false") return text == "true";
    try {
        return parseNumber(text);
    } catch (const std::logic_error&) {
        return text;
    }
}

}  // namespace velkor::configuration
