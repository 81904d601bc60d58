#pragma once

#include <locale>

namespace velkor::testing {

/// Makes a locale the global one of the C++ library while it lives, as a host would.
class ScopedGlobalLocale {
public:
    explicit ScopedGlobalLocale(const std::locale& locale)
        : previous(std::locale::global(locale)) {}
    ~ScopedGlobalLocale() { std::locale::global(previous); }

    ScopedGlobalLocale(const ScopedGlobalLocale&) = delete;
    ScopedGlobalLocale& operator=(const ScopedGlobalLocale&) = delete;

private:
    std::locale previous;
};

/// Numbers as much of Europe writes them: 1.234,5 and words for the truth.
class CommaNumbers : public std::numpunct<char> {
protected:
    char do_decimal_point() const override { return ','; }
    char do_thousands_sep() const override { return '.'; }
    std::string do_grouping() const override { return "\3"; }
    std::string do_truename() const override { return "wahr"; }
    std::string do_falsename() const override { return "falsch"; }
};

}  // namespace velkor::testing
