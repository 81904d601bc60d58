// A whole process: load the library, build a store, add a file of 100 KB, end.

#include <filesystem>
#include <stdexcept>
#include <string>

#include "benchmarks/support/Harness.hpp"
#include "benchmarks/support/PropertyText.hpp"
#include "tests/support/TemporaryFile.hpp"

#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

namespace velkor::benchmarks {

namespace {

void runProgram(const std::string& program, const std::string& argument) {
    std::string arguments[] = {program, argument};
    char* const argv[] = {arguments[0].data(), arguments[1].data(), nullptr};
    pid_t child = 0;
    int status = 0;
    if (posix_spawn(&child, program.c_str(), nullptr, nullptr, argv, environ) != 0 ||
        waitpid(child, &status, 0) != child || status != 0) {
        throw std::runtime_error(program + " failed");
    }
}

// The programs lie beside this one.
void measureStart(const std::string& contender) {
    measure("start/100KB/" + contender, [contender] {
        const auto here = std::filesystem::read_symlink("/proc/self/exe").parent_path();
        return [program = (here / ("start-" + contender)).string(),
                file = std::make_shared<testing::TemporaryFile>(propertyText(2'270))] {
            runProgram(program, file->path().string());
        };
    }).elsewhere();
}

}  // namespace

void addOperations() {
    for (const char* const contender : {"floor", "velkor", "poco"}) measureStart(contender);
}

}  // namespace velkor::benchmarks
