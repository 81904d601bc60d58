// Writes to the state file that it is given through a store, and ends without waiting.

#include <memory>

#include <unistd.h>

#include "configuration/ConfigurationImpl.hpp"
#include "layers/sqlite/SqliteSource.hpp"

int main(int, char** arguments) {
    ::alarm(60);  // should it hang
    auto store = std::make_shared<velkor::configuration::ConfigurationImpl>();
    store->addSource("state", "", -1, false, velkor::layers::SqliteSource::open(arguments[1]));
    store->set("written", 1);
}
