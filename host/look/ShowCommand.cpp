#include "host/console/OptionWords.hpp"
#include "host/console/ValueText.hpp"
#include "host/look/JsonLines.hpp"
#include "host/look/KeyPattern.hpp"
#include "host/look/LookCommands.hpp"
#include "host/look/PlainText.hpp"
#include "settings/Secrets.hpp"

namespace velkor::host {

namespace {

using configuration::Option;

/// Shows the sources that hold one key, in order of precedence. There is one at least.
using ShowKey = std::function<void(const std::vector<Option>& holders, bool isSecret)>;

ShowKey inJson(JsonLines& lines, bool withSource, bool allSources) {
    return [&lines, withSource, allSources](const auto& holders, bool isSecret) {
        const Option& first = holders.front();
        if (allSources) return lines.add(first.key, holdersJson(holders, isSecret));
        if (withSource) return lines.add(first.key, optionJson(first, isSecret));
        lines.add(first.key, valueJson(first.value, isSecret));
    };
}

ShowKey inLines(CommandOutput& output, bool withSource) {
    return [&output, withSource, writer = std::make_shared<OptionWriter>()](const auto& holders,
                                                                            bool isSecret) {
        for (const Option& holder : holders) {
            const std::string& line = writer->text(holder.key, holder.value, isSecret);
            if (!withSource) {
                output.line(line);
                continue;
            }
            const bool isFirst = &holder == &holders.front();
            output.line(line + " (" + holder.source + (isFirst ? ")" : ", overridden)"));
        }
    };
}

ShowKey bare(CommandOutput& output) {
    return [&output](const auto& holders, bool isSecret) {
        output.line(settings::masked(isSecret, plainText(holders.front().value)));
    };
}

std::vector<Option> holdersOf(SessionStore& store, const std::string& key, bool allSources) {
    if (allSources) return store.explain(key).get();
    auto effective = std::move(store.read({key}).get().options.front());
    if (!effective) return {};  // it has gone since
    return {*std::move(effective)};
}

}  // namespace

void showOptions(const std::shared_ptr<SessionStore>& store,
                 const std::vector<std::string>& arguments, CommandOutput& output) {
    const OptionWords given("show", showUsage, 0, arguments);
    const bool raw = given.has("--raw");
    const bool json = given.has("--json");
    const bool all = given.has("--all");
    const bool withSource = all || given.has("--source");
    if (raw && (json || withSource)) throw CommandError("--raw goes with no other option.");

    const auto secrets = settings::secretKeys(store);
    KeySelection selection(given.texts(), *store);
    std::optional<JsonLines> lines;
    if (json) lines.emplace(output);
    const ShowKey show = raw    ? bare(output)
                         : json ? inJson(*lines, withSource, all)
                                : inLines(output, withSource);
    selection.forEach([&](const std::string& key) {
        const auto holders = holdersOf(*store, key, all);
        if (!holders.empty()) show(holders, secrets.count(key) != 0);
    });
    if (json) lines->end();
    selection.requireAllFound();
}

}  // namespace velkor::host
