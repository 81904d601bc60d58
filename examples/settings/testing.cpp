#include <iostream>
#include <memory>

#include "settings/Setting.hpp"
#include "settings/testing/Override.hpp"

using namespace std::chrono_literals;
using velkor::settings::Setting;
using velkor::settings::testing::Override;

int main() {
    const auto store = std::make_shared<velkor::configuration::ConfigurationImpl>();
    const Setting<std::chrono::milliseconds> pause(store, "retry.pause", 5s);
    {
        const Override noPause(store, "retry.pause", 0ms);
        std::cout << "in the test " << pause.get().count() << " ms\n";
    }
    std::cout << "afterwards " << pause.get().count() << " ms\n";
}
