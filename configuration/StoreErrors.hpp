#pragma once

#include <exception>

#include "framework/common/Export.hpp"

/// The texts of the errors of a store and its sources. Each is part of the interface; what they are
/// about (a key, a name, a path) follows those that end in a blank.
namespace velkor::configuration::store_errors {

inline constexpr const char* noSuchOption = "No option with the specified key was found: ";
inline constexpr const char* noOptionValue = "No option value for key: ";
inline constexpr const char* noOption = "No option for key: ";
inline constexpr const char* noWritableSource = "No writable configuration source for key: ";
inline constexpr const char* sourceNotWritable = "Source not found or not writable: ";
inline constexpr const char* cannotForget = "Configuration source can't forget keys: ";
inline constexpr const char* changesRefused = "Changes refused: ";
inline constexpr const char* writingNotSupported = "PropertyFileSource does not support writing";
inline constexpr const char* duplicateSource = "Source with the requested name already exists: ";
inline constexpr const char* nullSource = "A configuration source must not be null.";
// As the standard library says it of its own tables, in some of its versions.
inline constexpr const char* notInTable = "_Map_base::at";
inline constexpr const char* nullText = "A text must not be null.";
inline constexpr const char* fileNotOpened = "Property file could not be opened: ";
inline constexpr const char* fileNotAllowed = "Property file not allowed: ";

}  // namespace velkor::configuration::store_errors

namespace velkor::configuration {

/// What an exception of a store, or of the service in front of one, refuses.
enum class Refusal {
    other,            ///< Anything else: what foreign code throws, for example.
    missingOption,    ///< No source has the key.
    notWritable,      ///< No source takes the write.
    duplicateSource,  ///< A source of that name is there already.
    fileNotOpened,    ///< The property file can't be opened.
    fileNotAllowed,   ///< The property file lies where it is not taken from.
    notRunning,       ///< The service is not running.
    misrouted,        ///< The message is not for the service.
};

/// Tells what kind of refusal `error` is, by its exact type and the beginning of its text.
VELKOR_EXPORT Refusal refusalOf(const std::exception& error) noexcept;

}  // namespace velkor::configuration
