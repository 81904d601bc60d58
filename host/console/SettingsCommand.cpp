#include "host/console/SettingsCommand.hpp"

#include <cstddef>
#include <optional>
#include <set>
#include <string>
#include <utility>
#include <vector>

#include "host/TerminalText.hpp"
#include "host/console/Table.hpp"
#include "settings/Describe.hpp"

namespace velkor::host {

namespace {

using Words = std::vector<std::string>;
using StorePtr = std::shared_ptr<configuration::ConfigurationImpl>;

constexpr const char* undeclaredOption = "--undeclared";

bool begins(const std::string& prefix, const std::string& key) {
    return key.compare(0, prefix.size(), prefix) == 0;
}

std::string orDash(const std::string& text) {
    return text.empty() ? "-" : text;
}

// One long text would make every row of the table as long.
std::string shortened(const std::optional<std::string>& value) {
    constexpr std::size_t mostShownBytes = 60;
    return orDash(abbreviated(value.value_or(""), mostShownBytes));
}

std::string notesOf(const settings::Description& setting) {
    std::string notes = setting.secret ? "secret" : "";
    if (setting.secret && setting.needsRestart) notes += ", ";
    if (setting.needsRestart) notes += "needs restart";
    return notes;
}

std::string showDeclared(const StorePtr& store, const std::string& prefix) {
    std::vector<Words> rows{
        {"KEY", "VALUE", "SOURCE", "DEFAULT", "TYPE", "CONSTRAINT", "NOTES", "DESCRIPTION"}};
    std::set<std::string> errors;  // the fields of a struct have one together
    for (const auto& setting : settings::describe(store)) {
        if (!begins(prefix, setting.key)) continue;
        rows.push_back({setting.key, shortened(setting.value), orDash(setting.source),
                        shortened(setting.defaultText), setting.type, orDash(setting.constraint),
                        orDash(notesOf(setting)), setting.description});
        if (setting.error) errors.insert(*setting.error);
    }
    if (rows.size() == 1 && prefix.empty()) return "No setting is declared.";
    if (rows.size() == 1) return "No setting is declared whose key begins with: " + prefix;
    std::string text = formatTable(rows);
    for (const auto& error : errors) text += error + '\n';
    return text;
}

std::string showUndeclared(const StorePtr& store, const std::string& prefix) {
    std::vector<Words> rows{{"KEY", "NEAR MISS OF"}};
    for (const auto& undeclared : settings::undeclaredKeys(store)) {
        if (!begins(prefix, undeclared.key)) continue;
        rows.push_back({undeclared.key, undeclared.meant.value_or("-")});
    }
    return rows.size() == 1 ? "" : formatTable(rows);
}

std::string show(const StorePtr& store, const Words& arguments) {
    auto argument = arguments.begin();
    const bool undeclared = argument != arguments.end() && *argument == undeclaredOption;
    if (undeclared) ++argument;
    if (arguments.end() - argument > 1) {
        throw CommandError("settings takes one KEY-PREFIX; given: " + arguments[0] + ' ' +
                           arguments[1]);
    }
    const std::string prefix = argument == arguments.end() ? "" : *argument;
    return undeclared ? showUndeclared(store, prefix) : showDeclared(store, prefix);
}

Words suggest(const StorePtr& store) {
    std::set<std::string> keys;
    for (const auto& setting : settings::describe(store)) keys.insert(setting.key);
    Words words{undeclaredOption};
    words.insert(words.end(), keys.begin(), keys.end());
    return words;
}

CommandRegistry::CommandPtr makeCommand(const StorePtr& store) {
    const auto handler = [store](Words&& arguments) { return show(store, arguments); };
    CommandTraits traits{"[--undeclared] [KEY-PREFIX]", false, [store] { return suggest(store); }};
    return std::make_shared<const Command>(
        administration::CommandDescriptor{
            "settings", "List the settings that are declared, or the keys that are not.", handler,
            0, 2},
        std::move(traits));
}

}  // namespace

SettingsCommand::SettingsCommand(const StorePtr& store,
                                 const std::shared_ptr<CommandRegistry>& registry)
    : registration(registry, makeCommand(store)) {}

}  // namespace velkor::host
