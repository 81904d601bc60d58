#include <iostream>
#include <memory>

#include "settings/Setting.hpp"

using namespace std::chrono_literals;
using namespace velkor::settings;

int main() {
    const auto store = std::make_shared<velkor::configuration::ConfigurationImpl>();
    store->addPropertyFileSource("site", "", 1000, true, "examples/site.properties");

    Setting<int> port(store, "server.port", 80, between(1, 65535));
    const Setting<std::chrono::milliseconds> timeout(store, "server.timeout", 30s);
    const Setting<bool> fuzzy(store, "feature.search.fuzzy", false);
    std::cout << "port " << port << ", timeout " << timeout.get().count() << " ms, fuzzy " << fuzzy
              << '\n';

    const auto handle = port.onChange(
        [](int before, int now) { std::cout << "port " << before << " is now " << now << '\n'; });
    store->set("server.port", 9090);
}
