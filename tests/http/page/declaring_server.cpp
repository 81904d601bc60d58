// Serves a store whose process has declared settings, at any port, until standard input ends.
#include <iostream>
#include <limits>
#include <memory>
#include <string>

#include "configuration/ConfigurationImpl.hpp"
#include "http/Server.hpp"
#include "settings/Setting.hpp"

using velkor::configuration::ConfigurationImpl;
using velkor::http::Server;
using velkor::http::ServerOptions;
using velkor::settings::between;
using velkor::settings::description;
using velkor::settings::secret;
using velkor::settings::Setting;

int main() {
    const auto store = std::make_shared<ConfigurationImpl>();
    store->set("http.port", 8080);
    store->set("db.password", std::string("hidden from all"));
    const Setting<int> port(store, "http.port", 80, between(1, 65535),
                            description("Where clients connect"));
    const Setting<std::string> password(store, "db.password", "", secret());

    ServerOptions options;
    options.allowWrites = true;
    const Server server(store, options);
    std::cout << "Listening on http://" << server.endpoints().front() << "/" << std::endl;
    std::cin.ignore(std::numeric_limits<std::streamsize>::max());
}
