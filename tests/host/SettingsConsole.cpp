#include <exception>
#include <iostream>
#include <memory>
#include <string>
#include <vector>

#include "host/Program.hpp"
#include "settings/Setting.hpp"

namespace {

using velkor::configuration::ConfigurationImpl;
using namespace velkor::settings;

/// The settings of a program that lends its operators the console.
struct ServerSettings {
    explicit ServerSettings(const std::shared_ptr<ConfigurationImpl>& store)
        : port(store, "server.port", 8080, between(1, 65535)),
          password(store, "server.password", secret()) {}

    Setting<int> port;
    Setting<std::string> password;  // must be there
};

}  // namespace

int main(int argc, char** argv) {
    try {
        const std::vector<std::string> arguments(argv + 1, argv + argc);
        return static_cast<int>(velkor::host::runProgram(arguments, [](const auto& store) {
            return std::make_shared<const ServerSettings>(store);
        }));
    } catch (const std::exception& error) {
        std::cerr << error.what() << '\n';
        return 1;
    }
}
