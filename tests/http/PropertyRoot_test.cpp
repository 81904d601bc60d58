#include "http/detail/PropertyRoot.hpp"

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <atomic>
#include <cstdint>
#include <cstdio>
#include <filesystem>
#include <stdexcept>
#include <string>
#include <thread>

#include "http/Refused.hpp"
#include "tests/support/TemporaryFile.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::http::detail {
namespace {

namespace fs = std::filesystem;
using velkor::testing::TemporaryFile;
using velkor::testing::thrownText;

constexpr std::uintmax_t mostBytes = 1000;

/// A root with a file in it, beside a file that is not for clients.
class PropertyRootTest : public ::testing::Test {
protected:
    PropertyRootTest() {
        fs::create_directory(folder);
        fs::create_directory(folder / "deep");
        fs::copy_file(inside.path(), folder / "inside.properties");
        fs::copy_file(inside.path(), folder / "deep" / "inside.properties");
    }

    /// What reading gives: the content, or the text of the refusal.
    std::string outcome(const std::string& path) const {
        try {
            return PropertyRoot(folder, mostBytes).read(path);
        } catch (const std::runtime_error& error) {
            return error.what();
        }
    }

    static std::string notAllowed(const std::string& path) {
        return "Property file not allowed: " + path;
    }

    static std::string notOpened(const std::string& path, const std::string& reason) {
        return "Property file could not be opened: " + path + ": " + reason;
    }

    fs::path beside(const std::string& name) const { return outside.parent() / name; }

    const TemporaryFile inside{"a = inside\n"};
    const TemporaryFile outside{"a = outside\n", "outside.properties"};
    const fs::path folder = outside.parent() / "root";
};

TEST_F(PropertyRootTest, ReadsAFileBelowIt) {
    EXPECT_EQ(outcome(folder / "inside.properties"), "a = inside\n");
    EXPECT_EQ(outcome(folder / "deep" / "inside.properties"), "a = inside\n");
}

TEST_F(PropertyRootTest, IsWhereARelativePathBegins) {
    EXPECT_EQ(outcome("inside.properties"), "a = inside\n");
    EXPECT_EQ(outcome("./deep/../deep/inside.properties"), "a = inside\n");
}

TEST_F(PropertyRootTest, MayBeNamedByALink) {
    fs::create_symlink(folder, beside("alias"));
    const PropertyRoot root(beside("alias"), mostBytes);
    EXPECT_EQ(root.read(beside("alias") / "inside.properties"), "a = inside\n");
    EXPECT_EQ(root.read(folder / "inside.properties"), "a = inside\n");
}

TEST_F(PropertyRootTest, MayBeAllThereIs) {
    EXPECT_EQ(PropertyRoot("/", mostBytes).read(outside.path()), "a = outside\n");
}

TEST_F(PropertyRootTest, FollowsLinksThatStayBelowIt) {
    fs::create_symlink(folder / "deep" / "inside.properties", folder / "link");
    EXPECT_EQ(outcome("link"), "a = inside\n");
}

TEST_F(PropertyRootTest, RefusesWhatIsNotBelowIt) {
    fs::create_directory(beside("root-too"));
    fs::copy_file(outside.path(), beside("root-too") / "file");
    for (const std::string& path :
         {outside.path().string(), std::string("../outside.properties"),
          folder.string() + "/../outside.properties", beside("root-too").string() + "/file",
          folder.string(), std::string("."), std::string(), std::string("/")}) {
        EXPECT_EQ(outcome(path), notAllowed(path));
    }
}

TEST_F(PropertyRootTest, RefusesLinksThatLeadOutOfIt) {
    fs::create_symlink(outside.path(), folder / "link");
    fs::create_symlink(outside.parent(), folder / "folder");
    fs::create_symlink("/proc/self", folder / "self");
    EXPECT_EQ(outcome("link"), notAllowed("link"));
    EXPECT_EQ(outcome("folder/outside.properties"), notAllowed("folder/outside.properties"));
    EXPECT_EQ(outcome("self/environ"), notAllowed("self/environ"));
}

TEST_F(PropertyRootTest, DoesNotTellWhatThereIsOutside) {
    const std::string missing = beside("missing");
    EXPECT_EQ(outcome(missing), notAllowed(missing));
    EXPECT_EQ(outcome("../missing"), notAllowed("../missing"));
}

TEST_F(PropertyRootTest, SaysWhyAFileBelowItIsNotOpened) {
    EXPECT_EQ(outcome("missing"), notOpened("missing", "No such file or directory"));
    EXPECT_EQ(outcome("deep"), notOpened("deep", "Not a regular file"));
    EXPECT_EQ(outcome("inside.properties/"), notOpened("inside.properties/", "Not a directory"));
    const std::string cut("inside.properties\0.txt", 22);
    EXPECT_EQ(outcome(cut), "Property file could not be opened: inside.properties");
}

// Opening the pipe for reading would wait for a writer.
TEST_F(PropertyRootTest, OpensNeitherPipesNorSockets) {
    ASSERT_EQ(::mkfifo((folder / "pipe").c_str(), 0600), 0);
    EXPECT_EQ(outcome("pipe"), notOpened("pipe", "Not a regular file"));
}

TEST_F(PropertyRootTest, RefusesDevices) {
    EXPECT_EQ(
        thrownText<std::runtime_error>([] { PropertyRoot("/dev", mostBytes).read("/dev/zero"); }),
        notOpened("/dev/zero", "Not a regular file"));
}

TEST_F(PropertyRootTest, ReadsNoMoreThanItsLimit) {
    const PropertyRoot exact(folder, 11);
    EXPECT_EQ(exact.read("inside.properties"), "a = inside\n");
    const PropertyRoot small(folder, 10);
    EXPECT_EQ(thrownText<std::runtime_error>([&] { small.read("inside.properties"); }),
              notOpened("inside.properties", "Larger than 10 bytes"));
}

TEST_F(PropertyRootTest, StaysTheFolderThatItWas) {
    const PropertyRoot root(folder, mostBytes);
    fs::rename(folder, beside("moved"));
    fs::create_directory(folder);
    fs::copy_file(outside.path(), folder / "inside.properties");
    EXPECT_EQ(root.read("inside.properties"), "a = inside\n");
    const std::string impostor = folder / "inside.properties";
    EXPECT_EQ(thrownText<std::runtime_error>([&] { root.read(impostor); }), notAllowed(impostor));
}

TEST_F(PropertyRootTest, MustBeAFolder) {
    const std::string missing = beside("missing");
    EXPECT_EQ(thrownText<Refused>([&] { PropertyRoot(missing, mostBytes); }),
              "can't use the property root " + missing + ": No such file or directory");
    EXPECT_EQ(thrownText<Refused>([&] { PropertyRoot(outside.path(), mostBytes); }),
              "can't use the property root " + outside.path().string() + ": Not a directory");
}

/// Lets two entries of a folder change places over and over, on a thread of its own.
class Swapping {
public:
    Swapping(std::string first, std::string second)
        : thread([this, one = std::move(first), other = std::move(second)] {
              while (!ended) {
                  ::renameat2(AT_FDCWD, one.c_str(), AT_FDCWD, other.c_str(), RENAME_EXCHANGE);
                  ++swaps;
              }
          }) {}
    ~Swapping() {
        ended = true;
        thread.join();
    }

    Swapping(const Swapping&) = delete;
    Swapping& operator=(const Swapping&) = delete;

    int count() const { return swaps; }

private:
    std::atomic<bool> ended{false};
    std::atomic<int> swaps{0};
    std::thread thread;
};

/// Reads `path` until it was swapped often, and gives how often the file outside was read.
int readingsOutside(const PropertyRoot& root, const std::string& path, const Swapping& swapping) {
    constexpr int enough = 20'000;
    int outside = 0;
    while (swapping.count() < enough) {
        try {
            if (root.read(path) != "a = inside\n") ++outside;
        } catch (const std::runtime_error&) {
            continue;  // it leads out just now
        }
    }
    return outside;
}

TEST_F(PropertyRootTest, IsNotLeftByALinkThatChangesMeanwhile) {
    fs::create_symlink(outside.path(), folder / "link");
    const PropertyRoot root(folder, mostBytes);
    const Swapping swapping(folder / "link", folder / "inside.properties");
    EXPECT_EQ(readingsOutside(root, "inside.properties", swapping), 0);
}

TEST_F(PropertyRootTest, IsNotLeftByAFolderThatChangesMeanwhile) {
    fs::create_directory(beside("elsewhere"));
    fs::copy_file(outside.path(), beside("elsewhere") / "inside.properties");
    fs::create_symlink(beside("elsewhere"), folder / "link");
    const PropertyRoot root(folder, mostBytes);
    const Swapping swapping(folder / "link", folder / "deep");
    EXPECT_EQ(readingsOutside(root, "deep/inside.properties", swapping), 0);
}

}  // namespace
}  // namespace velkor::http::detail
