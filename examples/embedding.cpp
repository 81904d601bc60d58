#include <iostream>
#include <memory>

#include "configuration/ConfigurationImpl.hpp"
#include "configuration/admin/ValueFormat.hpp"
#include "framework/reactive_streams/CallbackSubscriber.hpp"

using velkor::configuration::formatValue;

int main() {
    // A store lives in a shared pointer.
    const auto store = std::make_shared<velkor::configuration::ConfigurationImpl>();
    store->addPropertyFileSource("site", "", 1000, true, "examples/site.properties");

    const auto watch = velkor::reactive_streams::subscribe(
        *store->watchOption("server.port"), {[](const auto& port) {
            formatValue(std::cout << "port ", port);
            std::cout << '\n';
        }});

    store->set("server.port", 9090);  // order 0, in front of the file
    for (const auto& layer : store->explain("server.port").get()) {
        formatValue(std::cout << layer.source << " says ", layer.value);
        std::cout << '\n';
    }
}
