#include "host/console/MaskingRegistry.hpp"

#include <utility>
#include <vector>

#include "host/console/ValueText.hpp"
#include "settings/Secrets.hpp"

namespace velkor::host {

namespace {

using administration::CommandHandler;
using Arguments = std::vector<std::string>;
using StorePtr = std::shared_ptr<configuration::ConfigurationImpl>;

CommandHandler maskingGet(const StorePtr& store, CommandHandler get) {
    return [store, get = std::move(get)](Arguments&& arguments) {
        const std::string key = arguments.at(0);
        // The command looks for the key itself, and may find none.
        const bool isSecret = settings::secretKeys(store).count(key) != 0 && store->has(key).get();
        return isSecret ? settings::secretMark : get(std::move(arguments));
    };
}

CommandHandler maskingList(const StorePtr& store, CommandHandler list) {
    return [store, list = std::move(list)](Arguments&& arguments) {
        const auto secrets = settings::secretKeys(store);
        if (secrets.empty()) return list(std::move(arguments));
        std::string text;
        for (const auto& key : store->keys().get()) {
            text += optionText(key, store->get(key).get(), secrets.count(key) != 0) + '\n';
        }
        return text;
    };
}

}  // namespace

MaskingRegistry::MaskingRegistry(StorePtr maskedStore,
                                 std::shared_ptr<administration::Administration> commandRegistry)
    : store(std::move(maskedStore)), registry(std::move(commandRegistry)) {}

Future<bool> MaskingRegistry::registerCommand(administration::CommandDescriptor command) {
    if (command.name == "velkor.configuration.get") {
        command.handler = maskingGet(store, std::move(command.handler));
    } else if (command.name == "velkor.configuration.list") {
        command.handler = maskingList(store, std::move(command.handler));
    }
    return registry->registerCommand(std::move(command));
}

Future<bool> MaskingRegistry::unregisterCommand(const std::string& name) {
    return registry->unregisterCommand(name);
}

}  // namespace velkor::host
