#include <gtest/gtest.h>
#include <malloc.h>

#include <cstddef>
#include <string>

#include "tests/loading/LoadedLibrary.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace {

using velkor::testing::LoadedLibrary;
using velkor::testing::TemporaryFile;

using UseConfiguration = void(const char*, std::string&);

void loadUseAndUnload(const TemporaryFile& file) {
    const LoadedLibrary plugin(LOADING_PLUGIN);
    std::string complaint;
    plugin.function<UseConfiguration>("velkorUseConfiguration")(file.path().c_str(), complaint);
    ASSERT_EQ(complaint, "");
}

std::size_t bytesInUse() {
    return ::mallinfo2().uordblks;
}

TEST(UnloadingMemory, NothingIsKept) {
    const TemporaryFile file("file.key=file value\n");
    for (int round = 0; round < 20; ++round) loadUseAndUnload(file);
    const std::size_t before = bytesInUse();
    for (int round = 0; round < 100; ++round) loadUseAndUnload(file);
    EXPECT_EQ(bytesInUse(), before);
}

}  // namespace
