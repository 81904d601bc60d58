#include <algorithm>
#include <optional>

#include "host/console/ValueText.hpp"
#include "host/look/KeyWalk.hpp"
#include "host/look/LookCommands.hpp"
#include "settings/Secrets.hpp"

namespace velkor::host {

namespace {

using configuration::Option;
using Holders = std::vector<Option>;

void requireSource(SessionStore& store, const std::string& name) {
    const auto sources = store.describeSources().get();
    const bool isThere = std::any_of(sources.begin(), sources.end(),
                                     [&](const auto& source) { return source.name == name; });
    if (!isThere) throw CommandError("No source is called: " + name);
}

/// Where the source `name` stands in `holders`, or their end.
Holders::const_iterator find(const Holders& holders, const std::string& name) {
    return std::find_if(holders.begin(), holders.end(),
                        [&](const Option& holder) { return holder.source == name; });
}

/// What `after` makes of `before`, which may be the end of `holders`; empty if that is nothing.
std::string changeText(const Holders& holders, Holders::const_iterator before,
                       Holders::const_iterator after, bool isSecret) {
    if (before == holders.end()) return "+ " + optionText(after->key, after->value, isSecret);
    if (before->value == after->value) return "";
    return "~ " + optionText(after->key, before->value, isSecret) + " -> " +
           valueText(after->value, isSecret);
}

void showChange(const Holders& holders, const std::vector<std::string>& names, bool isSecret,
                CommandOutput& output) {
    const auto after = find(holders, names.back());
    if (after == holders.end()) return;
    const auto before = names.size() == 1 ? after + 1 : find(holders, names.front());
    const std::string text = changeText(holders, before, after, isSecret);
    if (!text.empty()) output.line(text);
}

void showAllChanges(const Holders& holders, bool isSecret, CommandOutput& output) {
    for (auto after = holders.begin(); after != holders.end(); ++after) {
        const std::string text = changeText(holders, after + 1, after, isSecret);
        if (!text.empty()) output.line(text + " (" + after->source + ')');
    }
}

}  // namespace

void diffSources(const std::shared_ptr<SessionStore>& store,
                 const std::vector<std::string>& arguments, CommandOutput& output) {
    for (const auto& name : arguments) requireSource(*store, name);
    const auto secrets = settings::secretKeys(store);
    walkKeys(*store, "", [&](const std::string& key) {
        const bool isSecret = secrets.count(key) != 0;
        const auto holders = store->explain(key).get();
        if (arguments.empty()) {
            showAllChanges(holders, isSecret, output);
        } else {
            showChange(holders, arguments, isSecret, output);
        }
        return true;
    });
}

}  // namespace velkor::host
