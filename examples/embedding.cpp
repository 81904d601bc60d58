#include <iostream>
#include <memory>

#include "configuration/ConfigurationImpl.hpp"
#include "framework/reactive_streams/CallbackSubscriber.hpp"

int main() {
    const auto store = std::make_shared<velkor::configuration::ConfigurationImpl>();
    // Its keys begin with "server."; order 100 is behind "override", which takes the writes.
    store->addInMemorySource("factory", "server", 100, true, {{"port", 8080}});

    const auto watch = velkor::reactive_streams::subscribe(
        *store->watchOption("server.port"),
        {[](const auto& port) { std::cout << "port " << boost::get<int>(port) << '\n'; }});

    store->set("server.port", 9090);
    for (const auto& layer : store->explain("server.port").get()) {
        std::cout << layer.source << " says " << boost::get<int>(layer.value) << '\n';
    }
}
