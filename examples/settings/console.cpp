#include <exception>
#include <iostream>
#include <memory>
#include <string>
#include <vector>

#include "host/Program.hpp"
#include "settings/Setting.hpp"

using velkor::configuration::ConfigurationImpl;
using namespace velkor::settings;

struct Server {
    explicit Server(const std::shared_ptr<ConfigurationImpl>& store)
        : port(store, "server.port", 8080, between(1, 65535), description("where it listens")),
          password(store, "server.password", secret(), needsRestart()) {}

    Setting<int> port;
    Setting<std::string> password;  // must be there
};

int main(int argc, char** argv) {
    try {
        const std::vector<std::string> arguments(argv + 1, argv + argc);
        return static_cast<int>(velkor::host::runProgram(
            arguments, [](const auto& store) { return std::make_shared<const Server>(store); }));
    } catch (const std::exception& error) {  // a setting does not fit
        std::cerr << error.what() << '\n';
        return 1;
    }
}
