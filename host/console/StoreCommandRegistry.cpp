#include "host/console/StoreCommandRegistry.hpp"

#include <exception>
#include <utility>
#include <vector>

#include "host/TerminalText.hpp"
#include "host/console/ValueText.hpp"
#include "host/console/ValueWords.hpp"
#include "host/look/KeyWalk.hpp"
#include "settings/Secrets.hpp"

namespace velkor::host {

namespace {

using administration::CommandHandler;
using configuration::AppliedChange;
using SessionPtr = std::shared_ptr<SessionStore>;

constexpr const char* getName = "velkor.configuration.get";
constexpr const char* setName = "velkor.configuration.set";
constexpr const char* listName = "velkor.configuration.list";
constexpr const char* nothingStored = "nothing was stored; put says why";
constexpr std::size_t mostShownBytes = 60;

std::string argumentNames(const std::string& command) {
    if (command == setName) return "KEY VALUE";
    return command == getName ? "KEY" : "";
}

/// What is to be said of `text` that was set for `key`; empty when it is there as it was meant.
std::string remarkOn(const SessionPtr& store, const std::string& key, const std::string& text) {
    const std::string beginning = "set " + abbreviated(key, mostShownBytes) + ": ";
    try {
        const AppliedChange written = store->apply({{key, text}}, true).get().front();
        if (!written.before) return beginning + nothingStored;
        if (isMeantBy(text, *written.before)) return "";
        const bool isSecret = settings::secretKeys(store).count(key) != 0;
        return beginning + settings::masked(isSecret, abbreviated(text, mostShownBytes)) +
               " was stored as " + valueText(*written.before, isSecret) +
               "; put stores the whole word";
    } catch (const std::exception&) {
        return beginning + nothingStored;
    }
}

CommandHandler remarkingSet(const SessionPtr& store, CommandHandler set,
                            StoreCommandRegistry::Remark remark) {
    return [store, set = std::move(set),
            remark = std::move(remark)](std::vector<std::string>&& arguments) {
        const std::string key = arguments.at(0);
        const std::string text = arguments.at(1);
        std::string answer = set(std::move(arguments));
        std::string remarks = remarkOn(store, key, text);
        if (!remarks.empty()) remark(std::move(remarks));
        return answer;
    };
}

CommandHandler maskingGet(const SessionPtr& store, CommandHandler get) {
    return [store, get = std::move(get)](std::vector<std::string>&& arguments) {
        const std::string key = arguments.at(0);
        // The command looks for the key itself, and may find none.
        const bool isSecret = settings::secretKeys(store).count(key) != 0 && store->has(key).get();
        return isSecret ? settings::secretMark : get(std::move(arguments));
    };
}

// Every line as the command writes it.
StreamingHandler streamedList(const SessionPtr& store) {
    return [store](std::vector<std::string>&&, CommandOutput& output) {
        const auto secrets = settings::secretKeys(store);
        OptionWriter writer;
        walkKeys(*store, "", [&](const std::string& key) {
            output.line(writer.text(key, store->get(key).get(), secrets.count(key) != 0));
            return true;
        });
    };
}

}  // namespace

StoreCommandRegistry::StoreCommandRegistry(SessionPtr sessionStore,
                                           std::shared_ptr<CommandRegistry> commandRegistry,
                                           Remark showRemark)
    : store(std::move(sessionStore)),
      registry(std::move(commandRegistry)),
      remark(std::move(showRemark)) {}

Future<bool> StoreCommandRegistry::registerCommand(administration::CommandDescriptor command) {
    CommandTraits traits{argumentNames(command.name)};
    if (command.name == setName) {
        command.handler = remarkingSet(store, std::move(command.handler), remark);
    } else if (command.name == getName) {
        command.handler = maskingGet(store, std::move(command.handler));
    } else if (command.name == listName) {
        traits.stream = streamedList(store);
    }
    return registry->registerCommand(std::move(command), std::move(traits));
}

Future<bool> StoreCommandRegistry::unregisterCommand(const std::string& name) {
    return registry->unregisterCommand(name);
}

}  // namespace velkor::host
