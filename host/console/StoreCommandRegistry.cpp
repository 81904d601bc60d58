#include "host/console/StoreCommandRegistry.hpp"

#include <exception>
#include <utility>
#include <vector>

#include "host/TerminalText.hpp"
#include "host/console/ValueText.hpp"
#include "host/console/ValueWords.hpp"
#include "settings/Secrets.hpp"

namespace velkor::host {

namespace {

using administration::CommandHandler;
using configuration::AppliedChange;
using StorePtr = std::shared_ptr<SessionStore>;

constexpr const char* setName = "velkor.configuration.set";
constexpr const char* nothingStored = "nothing was stored; put says why";
constexpr std::size_t mostShownBytes = 60;

std::string argumentNames(const std::string& command) {
    if (command == setName) return "KEY VALUE";
    return command == "velkor.configuration.get" ? "KEY" : "";
}

/// What is to be said of `text` that was set for `key`; empty when it is there as it was meant.
std::string remarkOn(const StorePtr& store, const std::string& key, const std::string& text) {
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

CommandHandler remarkingSet(const StorePtr& store, CommandHandler set,
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

}  // namespace

StoreCommandRegistry::StoreCommandRegistry(StorePtr sessionStore,
                                           std::shared_ptr<CommandRegistry> commandRegistry,
                                           Remark showRemark)
    : store(std::move(sessionStore)),
      registry(std::move(commandRegistry)),
      remark(std::move(showRemark)) {}

Future<bool> StoreCommandRegistry::registerCommand(administration::CommandDescriptor command) {
    if (command.name == setName) {
        command.handler = remarkingSet(store, std::move(command.handler), remark);
    }
    CommandTraits traits{argumentNames(command.name)};
    return makeReadyFuture(
        registry->add(std::make_shared<const Command>(std::move(command), std::move(traits))));
}

Future<bool> StoreCommandRegistry::unregisterCommand(const std::string& name) {
    return registry->unregisterCommand(name);
}

}  // namespace velkor::host
