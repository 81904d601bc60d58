// fuzz-replay SEEDS TARGET: gives TARGET every file of its folder in SEEDS, and every beginning of
// it. For compilers without libFuzzer, and for findings that are to stay mended.

#include <algorithm>
#include <exception>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <iterator>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include "fuzz/Targets.hpp"

namespace velkor::fuzz {
namespace {

namespace fs = std::filesystem;

const Target& targetCalled(std::string_view name) {
    const auto found = std::find_if(targets().begin(), targets().end(),
                                    [&](const Target* each) { return each->name() == name; });
    if (found == targets().end()) throw std::invalid_argument("There is no such target.");
    return **found;
}

std::string contentOf(const fs::path& path) {
    std::ifstream file(path, std::ios::binary);
    file.exceptions(std::ios::badbit | std::ios::failbit);
    return {std::istreambuf_iterator<char>(file), {}};
}

// Throws when there are no seeds: a check of nothing would always pass.
std::vector<fs::path> seedsIn(const fs::path& folder) {
    std::vector<fs::path> seeds(fs::directory_iterator(folder), {});
    if (seeds.empty()) throw std::invalid_argument("There are no seeds.");
    std::sort(seeds.begin(), seeds.end());
    return seeds;
}

void replay(const Target& target, const fs::path& seeds) {
    std::size_t inputs = 0;
    for (const fs::path& seed : seedsIn(seeds)) {
        std::cout << seed.filename().string() << std::endl;  // stands last when one is wrong
        const std::string content = contentOf(seed);
        for (std::size_t length = 0; length <= content.size(); ++length, ++inputs) {
            target(std::string_view(content).substr(0, length));
        }
    }
    std::cout << inputs << " inputs, none of them wrong" << std::endl;
}

}  // namespace
}  // namespace velkor::fuzz

int main(int count, char** arguments) {
    try {
        if (count != 3) throw std::invalid_argument("usage: fuzz-replay SEEDS TARGET");
        velkor::fuzz::replay(velkor::fuzz::targetCalled(arguments[2]),
                             std::filesystem::path(arguments[1]) / arguments[2]);
    } catch (const std::exception& error) {
        std::cerr << "fuzz-replay: " << error.what() << std::endl;
        return 1;
    }
    return 0;
}
