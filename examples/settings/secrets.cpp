#include <iostream>
#include <memory>
#include <sstream>

#include "configuration/admin/ValueFormat.hpp"
#include "settings/Secrets.hpp"
#include "settings/Setting.hpp"

using namespace velkor::settings;

int main() {
    const auto store = std::make_shared<velkor::configuration::ConfigurationImpl>();
    const Setting<std::string> user(store, "user", "nobody");
    const Setting<int> pin(store, "pin", 1, between(0, 9999), secret());
    store->set("user", "somebody");
    store->set("pin", 47110);
    std::cout << pin.status().error.value_or("all is well") << '\n';

    const auto secrets = secretKeys(store);
    for (const auto& key : store->keys().get()) {
        std::ostringstream value;
        velkor::configuration::formatValue(value, store->get(key).get());
        std::cout << key << " = " << masked(secrets.count(key) != 0, value.str()) << '\n';
    }
}
