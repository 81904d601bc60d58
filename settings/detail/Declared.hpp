#pragma once

#include <chrono>
#include <optional>
#include <string>
#include <vector>

#include "configuration/Option.hpp"
#include "framework/common/DiagnosticLogger.hpp"
#include "framework/common/Export.hpp"
#include "settings/Converted.hpp"
#include "settings/Secrets.hpp"

namespace velkor::settings::detail {

/// What a program has declared of one key.
struct Declared {
    std::string key;
    std::string type{};
    std::optional<std::string> fallback{};  ///< The default as text, if there is one.
    std::string constraint{};               ///< Empty: any value is right.
    std::string description{};
    bool secret = false;
    bool needsRestart = false;
    bool orDefault = false;

    /// `text`, or ••• in the place of a secret.
    std::string shown(const std::string& text) const { return masked(secret, text); }
};

/// The value of one key, and where it comes from.
struct Standing {
    std::string value;   ///< As text, secrets too.
    std::string source;  ///< Empty: the default.
    std::chrono::system_clock::time_point since{};
};

/// What became of the values of all keys of a setting.
struct Verdict {
    std::vector<Standing> standings{};
    std::string complaints{};  ///< Separated by "; ".
    common::Severity severity = common::warning;
    bool holds = true;  ///< There is a new value.

    /// Adds a complaint that the new value stands in spite of.
    void complain(const std::string& text) {
        if (!complaints.empty()) complaints += "; ";
        complaints += text;
    }

    /// Adds a complaint for which there is no new value.
    void refuse(const std::string& text, common::Severity howBad) {
        complain(text);
        holds = false;
        if (howBad < severity) severity = howBad;
    }
};

/// "server.port: 'abc' from source "site" is no int: " and the reason.
VELKOR_EXPORT std::string refusalOf(const Declared& declared, const configuration::Option& option,
                                    const Reason& reason);

/// "server.port: no value, and no default".
VELKOR_EXPORT std::string absenceOf(const Declared& declared);

/// "server.port: the default 0 is not right: " and the reason.
VELKOR_EXPORT std::string unfitDefaultOf(const Declared& declared, const Reason& reason);

/// The reason that a check of the program gives by throwing. Not repeated for a secret.
VELKOR_EXPORT Reason failedCheck(bool secret, const char* text);

}  // namespace velkor::settings::detail
