#include <iostream>
#include <memory>
#include <string>
#include <thread>

#include "settings/Setting.hpp"

using velkor::settings::Setting;

int main() {
    const auto store = std::make_shared<velkor::configuration::ConfigurationImpl>();
    const Setting<std::string> greeting(store, "greeting", "hello");

    std::thread worker([&greeting] {
        auto reader = greeting.reader();  // one for each thread
        std::size_t letters = 0;
        for (int i = 0; i < 1'000'000; ++i) letters += reader.get().size();
        std::cout << letters << " letters\n";
    });
    worker.join();

    const auto snapshot = greeting.snapshot();  // stays as it is
    store->set("greeting", "good day");
    std::cout << *snapshot << ", " << *greeting.snapshot() << '\n';
}
