// Writes to the state file that it is given on the thread of its source, gives up the last
// references there, and ends at once.

#include <chrono>
#include <future>
#include <memory>
#include <string>
#include <thread>

#include <unistd.h>

#include "configuration/ConfigurationImpl.hpp"
#include "layers/sqlite/SqliteSource.hpp"

int main(int, char** arguments) {
    ::alarm(60);  // should it hang
    auto source = velkor::layers::SqliteSource::open(arguments[1]);
    std::promise<void> begun;
    std::promise<void> written;
    source->setChangeListener([&, main = std::this_thread::get_id()](const std::string& key) {
        // That it is set is told here, even if its time is over by then.
        if (key != "tick" || std::this_thread::get_id() == main) return;
        begun.get_future().wait();
        source->set("written", 1);
        source.reset();
        written.set_value();
    });
    source->setFor("tick", 1, std::chrono::milliseconds(1));
    begun.set_value();
    written.get_future().wait();
}
