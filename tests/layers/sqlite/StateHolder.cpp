// Writes to the state file that it is given, says so, and holds it until it is killed.

#include <iostream>

#include <unistd.h>

#include "layers/sqlite/SqliteSource.hpp"

int main(int, char** arguments) {
    ::alarm(60);  // should nobody do it
    velkor::layers::SqliteOptions options;
    options.author = "holder";
    const auto source = velkor::layers::SqliteSource::open(arguments[1], options);
    source->set("held", 1);
    source->committed().get();
    std::cout << "ready" << std::endl;
    ::pause();
}
