#include "host/console/MaskingRegistry.hpp"

#include <utility>
#include <vector>

#include "host/console/ValueText.hpp"
#include "host/look/KeyWalk.hpp"
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

// Every line as the command writes it.
StreamingHandler streamedList(const StorePtr& store) {
    return [store](Arguments&&, CommandOutput& output) {
        const auto secrets = settings::secretKeys(store);
        OptionWriter writer;
        walkKeys(*store, "", [&](const std::string& key) {
            output.line(writer.text(key, store->get(key).get(), secrets.count(key) != 0));
            return true;
        });
    };
}

}  // namespace

MaskingRegistry::MaskingRegistry(StorePtr maskedStore,
                                 std::shared_ptr<CommandRegistry> commandRegistry)
    : store(std::move(maskedStore)), registry(std::move(commandRegistry)) {}

Future<bool> MaskingRegistry::registerCommand(administration::CommandDescriptor command) {
    if (command.name == "velkor.configuration.get") {
        command.handler = maskingGet(store, std::move(command.handler));
    } else if (command.name == "velkor.configuration.list") {
        CommandTraits traits;
        traits.stream = streamedList(store);
        return makeReadyFuture(
            registry->add(std::make_shared<const Command>(std::move(command), std::move(traits))));
    }
    return registry->registerCommand(std::move(command));
}

Future<bool> MaskingRegistry::unregisterCommand(const std::string& name) {
    return registry->unregisterCommand(name);
}

}  // namespace velkor::host
