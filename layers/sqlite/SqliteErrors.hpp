#pragma once

/// The texts of the errors of a `SqliteSource`, each part of the interface. What they are about
/// follows those that end in a blank: the path, ": " and the cause, or the number of a change.
namespace velkor::layers::sqlite_errors {

inline constexpr const char* notOpened = "State file could not be opened: ";
inline constexpr const char* notWritten = "State file could not be written: ";
inline constexpr const char* notRead = "State file could not be read: ";
inline constexpr const char* tooManyWaiting = "too many writes wait for the disk";
inline constexpr const char* noSuchChange = "No such change in the journal: ";
inline constexpr const char* noChange = "There is no change in the journal.";
inline constexpr const char* unknownKind =
    "Change can't be undone, its value is of no known kind: ";
inline constexpr const char* noLifetime = "A lifetime must be positive.";

}  // namespace velkor::layers::sqlite_errors
