#pragma once

#include <fstream>
#include <string>
#include <vector>

namespace velkor::testing {

/// The lines of the process's memory map that belong to this project's libraries and to the plugins
/// of these tests.
inline std::vector<std::string> mappedLibraries() {
    std::ifstream maps("/proc/self/maps");
    std::vector<std::string> found;
    for (std::string line; std::getline(maps, line);) {
        const bool ours = line.find("/libvelkor-") != std::string::npos ||
                          line.find("/libloading-plugin") != std::string::npos ||
                          line.find("/liboptional-plugin") != std::string::npos;
        if (ours) found.push_back(line);
    }
    return found;
}

}  // namespace velkor::testing
