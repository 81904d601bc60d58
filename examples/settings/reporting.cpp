#include <iostream>
#include <memory>

#include "settings/Describe.hpp"
#include "settings/Setting.hpp"

using namespace velkor::settings;

int main() {
    const auto store = std::make_shared<velkor::configuration::ConfigurationImpl>();
    const Setting<int> port(store, "server.port", 8080, needsRestart(), description("listens at"));
    const Setting<std::string> password(store, "server.password", "changeme", secret());
    store->set("server.prot", 9090);

    for (const Description& setting : describe(store)) {
        std::cout << setting.key << " = " << setting.value.value_or("") << " (" << setting.type
                  << (setting.needsRestart ? ", needs restart)\n" : ")\n");
    }
    for (const UndeclaredKey& unknown : undeclaredKeys(store)) {
        std::cout << unknown.key << "? " << unknown.meant.value_or("nobody asks") << '\n';
    }
    try {
        const Setting<int> number(store, "server.prot", between(1, 1024));
    } catch (const SettingError& error) {
        std::cout << error.what() << '\n';
    }
}
