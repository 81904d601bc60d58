#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "tests/loading/LoadedLibrary.hpp"
#include "tests/loading/MappedLibraries.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace {

using velkor::testing::LoadedLibrary;
using velkor::testing::mappedLibraries;
using velkor::testing::TemporaryFile;

// With threads of their own, connections, a database and a server, as often as the others.
TEST(UnloadingOptional, NothingStaysMappedOnceTheLibrariesWereUsed) {
    for (int round = 0; round < 100; ++round) {
        {
            const TemporaryFile file("file.key=file value\n");
            const LoadedLibrary plugin(OPTIONAL_PLUGIN);
            std::string complaint;
            plugin.function<void(const char*, std::string&)>("velkorUseConfiguration")(
                file.path().c_str(), complaint);
            ASSERT_EQ(complaint, "");
            ASSERT_FALSE(mappedLibraries().empty());
        }
        ASSERT_EQ(mappedLibraries(), std::vector<std::string>{}) << round;
    }
}

}  // namespace
