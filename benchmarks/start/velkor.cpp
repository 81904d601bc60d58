#include <filesystem>
#include <memory>

#include "configuration/ConfigurationImpl.hpp"

// start-velkor FILE
int main(int, char** argv) {
    const auto store = std::make_shared<velkor::configuration::ConfigurationImpl>();
    const bool added =
        store
            ->addPropertyFileSource("file", "", 1, true, std::filesystem::path(argv[1]).u16string())
            .get();
    return added ? 0 : 1;
}
