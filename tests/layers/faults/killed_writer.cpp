// killed_writer FILE SEED: writes at random into a state file, and reports after each group of
// writes that is acknowledged how many entries the journal holds. Goes on until it is killed.

#include <cstdint>
#include <cstdio>
#include <exception>
#include <string>

#include <unistd.h>

#include "tests/layers/faults/KilledWriter.hpp"

namespace {

void report(std::uint64_t number) {
    if (::write(STDOUT_FILENO, &number, sizeof number) != sizeof number) ::_exit(2);
}

}  // namespace

int main(int argc, char** argv) {
    if (argc != 3) return 2;
    try {
        const auto source = velkor::testing::openForKilledWriter(argv[1]);
        velkor::testing::StateModel model(velkor::testing::killedWriter,
                                          source->history("", 100'000));
        velkor::testing::Random random(std::stoull(argv[2]));
        velkor::testing::RandomWrites writes(random, source.get(), model);
        for (;;) {
            writes.writeSome({});
            source->committed().get();
            report(model.size());
        }
    } catch (const std::exception& error) {
        std::fprintf(stderr, "%s\n", error.what());
        return 1;
    }
}
