#include <filesystem>
#include <fstream>
#include <string>

#include "benchmarks/support/FloorParser.hpp"

// start-floor FILE: the language's library and a parser alone.
int main(int, char** argv) {
    std::ifstream stream(argv[1], std::ios::binary);
    std::string text(std::filesystem::file_size(argv[1]), '\0');
    stream.read(text.data(), static_cast<std::streamsize>(text.size()));
    return velkor::benchmarks::floorParse(text).empty() ? 1 : 0;
}
