#pragma once

#include <memory>
#include <string>
#include <vector>

#include "framework/administration/CommandProvider.hpp"
#include "host/SessionStore.hpp"
#include "host/console/CommandRegistration.hpp"

namespace velkor::host {

// The commands that look at the store as a whole, and at files. All write their answers as they go.
// Values of secret keys, see `settings::secretKeys`, are never shown. `KeyPattern` says which keys
// a PATTERN means. Where there are options, `arguments` are words as they were typed, and what
// `OptionWords` throws passes on.

/// What `showOptions` takes.
inline constexpr const char* showUsage = "[PATTERN...] [--source] [--all] [--json] [--raw]";

/// A line "KEY = VALUE" for each key that any
/// PATTERN means, or for all. With --source " (SOURCE)" follows; with --all there is such a line
/// for each source that holds the key, and ", overridden" in it for all but the first. With --json
/// one object of a member for each key, see `JsonLines`: its value; with --source an object of its
/// source and value; with --all an array of those. With --raw only the values, see `plainText`.
///
/// Throws `CommandError` at the end for patterns that no key matches, and "--raw goes with no other
/// option.".
void showOptions(const std::shared_ptr<SessionStore>& store,
                 const std::vector<std::string>& arguments, CommandOutput& output);

/// [[A] B]: what the source B changes of A, of all behind it when there is no A; or each source of
/// all behind it, with " (SOURCE)" at the end. A line "+ KEY = VALUE" for a key that is new with B,
/// "~ KEY = BEFORE -> AFTER" for one that has another value. Throws `CommandError` "No source is
/// called: " and the name.
void diffSources(const std::shared_ptr<SessionStore>& store,
                 const std::vector<std::string>& arguments, CommandOutput& output);

/// What `exportOptions` takes.
inline constexpr const char* exportUsage = "[PATTERN...] [--format properties|json]";

/// What is effective, in a form that can be loaded again:
/// a property file, or the JSON of `showOptions`. Secrets are left out, which is noted, and so is
/// how many values lose their type in a property file.
///
/// Throws `CommandError` as `showOptions`, "--format X: properties or json is needed", and for JSON
/// "JSON can't hold KEY: it is no UTF-8, or no finite number".
void exportOptions(const std::shared_ptr<SessionStore>& store,
                   const std::vector<std::string>& arguments, CommandOutput& output);

/// What `importFile` takes.
inline constexpr const char* importUsage = "FILE [--format properties|json]";

/// Sets everything that FILE holds, where `set` would, or nothing.
/// A file whose first byte that is no blank is { is JSON unless the option says otherwise.
///
/// Throws what `readPropertyFile` throws, `CommandError` "FILE: " with the text of
/// `messages::NoJsonObject` or "KEY is no object of a type and a value of that type", and what the
/// store refuses.
void importFile(const std::shared_ptr<SessionStore>& store,
                const std::vector<std::string>& arguments, CommandOutput& output);

/// FILE...: each remark on these property files, see `checkFiles`. Throws `CommandError` with how
/// many there are, and how many files could not be read, unless there is nothing to say.
void checkNamedFiles(const std::shared_ptr<SessionStore>& store,
                     const std::vector<std::string>& arguments, CommandOutput& output);

/// Keeps these commands registered while it lives, as show, diff, export, import and check.
/// Handlers share the store, so they may run after this object is gone.
class LookCommands final : public administration::CommandProvider {
public:
    /// Neither is null. A name that is taken stays with its owner. When this throws, none of the
    /// commands is left registered.
    LookCommands(const std::shared_ptr<SessionStore>& store,
                 const std::shared_ptr<CommandRegistry>& registry);
    LookCommands(const LookCommands&) = delete;
    LookCommands& operator=(const LookCommands&) = delete;

private:
    std::vector<CommandRegistration> registrations;
};

}  // namespace velkor::host
