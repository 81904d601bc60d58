#include <iostream>
#include <memory>
#include <string>
#include <vector>

#include "layers/etcd/EtcdSource.hpp"
#include "settings/Setting.hpp"

using velkor::layers::EtcdSource;
using velkor::settings::Setting;

// A host of the group "canary". Its arguments are the URLs of the members.
int main(int count, char** words) {
    const std::vector<std::string> members(words + 1, words + count);
    const auto canary = EtcdSource::open(members, "/shop/stage/canary/");
    const auto all = EtcdSource::open(members, "/shop/stage/all/");
    const auto store = std::make_shared<velkor::configuration::ConfigurationImpl>();
    store->addSource("canary", "", 90, false, canary);  // in front of the next one
    store->addSource("all", "", 100, false, all);
    const Setting<int> port(store, "server.port", 80);

    store->set("server.port", 8080, "all");
    all->committed().get();  // etcd has it: every host will
    std::cout << "before the trial: " << port << '\n';

    store->set("server.port", 8443, "canary");
    canary->committed().get();
    std::cout << "on trial: " << port << ", from";
    for (const auto& each : store->explain("server.port").get()) std::cout << ' ' << each.source;
    std::cout << '\n';

    store->set("server.port", 8443, "all");
    all->committed().get();
    store->unset("server.port", "canary");
    canary->committed().get();
    std::cout << "for all: " << port << ", from " << store->getOption("server.port").get().source
              << '\n';
}
