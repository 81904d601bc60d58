#include <gtest/gtest.h>

#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <thread>
#include <vector>

#include "tests/loading/LoadedLibrary.hpp"
#include "tests/loading/MappedLibraries.hpp"
#include "tests/support/BoundedWait.hpp"
#include "tests/support/TemporaryFile.hpp"

// This program is linked to none of the libraries: only what it loads and unloads itself is mapped.

namespace {

using velkor::testing::Latch;
using velkor::testing::LoadedLibrary;
using velkor::testing::mappedLibraries;
using velkor::testing::TemporaryFile;

using UseConfiguration = void(const char*, std::string&);

constexpr int rounds = 100;

class Unloading : public ::testing::Test {
protected:
    std::string useOf(const LoadedLibrary& library) const {
        std::string complaint;
        library.function<UseConfiguration>("velkorUseConfiguration")(file.path().c_str(),
                                                                     complaint);
        return complaint;
    }

    const TemporaryFile file{"file.key=file value\n"};
};

TEST_F(Unloading, LibrariesAreMappedWhileLoaded) {
    const LoadedLibrary plugin(LOADING_PLUGIN);
    EXPECT_FALSE(mappedLibraries().empty());
}

TEST_F(Unloading, NothingStaysMappedOfAnyLibrary) {
    for (int round = 0; round < rounds; ++round) {
        std::vector<std::unique_ptr<LoadedLibrary>> all;
        for (const char* const path : {ALL_LIBRARIES}) {
            all.push_back(std::make_unique<LoadedLibrary>(path));
        }
        ASSERT_GE(mappedLibraries().size(), all.size());
        all.clear();
        ASSERT_EQ(mappedLibraries(), std::vector<std::string>{});
    }
}

TEST_F(Unloading, NothingStaysMappedOnceTheLibrariesWereUsed) {
    for (int round = 0; round < rounds; ++round) {
        {
            const LoadedLibrary plugin(LOADING_PLUGIN);
            ASSERT_EQ(useOf(plugin), "");
        }
        ASSERT_EQ(mappedLibraries(), std::vector<std::string>{});
    }
}

TEST_F(Unloading, FrameworkMayBeReleasedInAnyOrder) {
    auto plugin = std::make_unique<LoadedLibrary>(LOADING_PLUGIN);
    auto framework = std::make_unique<LoadedLibrary>(FRAMEWORK_LIBRARY);
    EXPECT_EQ(useOf(*plugin), "");
    plugin.reset();
    framework.reset();
    EXPECT_EQ(mappedLibraries(), std::vector<std::string>{});
}

TEST_F(Unloading, ThreadThatUsedTheLibrariesMayOutliveThem) {
    Latch used;
    Latch unloaded;
    std::thread user;
    {
        const LoadedLibrary plugin(LOADING_PLUGIN);
        user = std::thread([&] {
            EXPECT_EQ(useOf(plugin), "");
            used.countDown();
            EXPECT_TRUE(unloaded.wait());
        });
        EXPECT_TRUE(used.wait());
    }
    EXPECT_EQ(mappedLibraries(), std::vector<std::string>{});
    unloaded.countDown();
    user.join();
}

// The loader has a lock of its own, but one that the thread sanitizer can't see.
class SynchronisedLibrary {
public:
    explicit SynchronisedLibrary(const std::string& path) {
        const std::lock_guard<std::mutex> lock(loader);
        library.emplace(path);
    }
    ~SynchronisedLibrary() {
        const std::lock_guard<std::mutex> lock(loader);
        library.reset();
    }
    SynchronisedLibrary(const SynchronisedLibrary&) = delete;
    SynchronisedLibrary& operator=(const SynchronisedLibrary&) = delete;

    const LoadedLibrary& operator*() const { return *library; }

private:
    static inline std::mutex loader;
    std::optional<LoadedLibrary> library;
};

TEST_F(Unloading, ThreadsMayUseTheLibrariesWhileOthersLoadAndUnloadThem) {
    std::vector<std::thread> threads;
    for (int thread = 0; thread < 3; ++thread) {
        threads.emplace_back([this] {
            for (int round = 0; round < 20; ++round) {
                const SynchronisedLibrary plugin(LOADING_PLUGIN);
                EXPECT_EQ(useOf(*plugin), "");
            }
        });
    }
    for (std::thread& thread : threads) thread.join();
    EXPECT_EQ(mappedLibraries(), std::vector<std::string>{});
}

}  // namespace
