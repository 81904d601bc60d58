// The file of the last known values.

#include "layers/etcd/detail/LastKnown.hpp"

#include <gtest/gtest.h>
#include <sys/stat.h>

#include <fstream>
#include <iterator>
#include <stdexcept>
#include <string>

#include "tests/support/TemporaryFile.hpp"
#include "tests/support/Thrown.hpp"

namespace velkor::layers::etcd {
namespace {

using testing::TemporaryFile;
using testing::thrownText;

class EtcdLastKnown : public ::testing::Test {
protected:
    static LastKnown sample() {
        LastKnown content;
        content.position = {"17", 42, std::string("p/\0a", 4), 40};
        content.values = {{"a", 5}, {std::string("b\n:\0", 4), std::string("\xFF\n")}, {"", true}};
        return content;
    }

    std::string bytes() const {
        std::ifstream in(file.path(), std::ios::binary);
        return {std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>()};
    }

    std::string problem(const std::string& prefix = "p/") const {
        return thrownText<std::runtime_error>([&] { readLastKnown(file.path(), prefix); });
    }

    std::string text(const std::string& reason) const {
        return file.path().string() + ": " + reason;
    }

    const TemporaryFile file{""};
};

TEST_F(EtcdLastKnown, GivesBackWhatWasWritten) {
    writeLastKnown(file.path(), "p/", sample());
    const LastKnown read = readLastKnown(file.path(), "p/");
    EXPECT_TRUE(read.values == sample().values);
    EXPECT_EQ(read.position.cluster, "17");
    EXPECT_EQ(read.position.revision, 42);
    EXPECT_EQ(read.position.witness, sample().position.witness);
    EXPECT_EQ(read.position.witnessModified, 40);
}

TEST_F(EtcdLastKnown, ReplacesWhatWasThere) {
    writeLastKnown(file.path(), "p/", sample());
    LastKnown other;
    other.position.revision = 43;
    writeLastKnown(file.path(), "p/", other);
    EXPECT_TRUE(readLastKnown(file.path(), "p/").values.empty());
}

TEST_F(EtcdLastKnown, IsForItsOwnerAlone) {
    std::filesystem::remove(file.path());
    writeLastKnown(file.path(), "p/", sample());
    struct stat status {};
    ASSERT_EQ(::stat(file.path().c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 0777U, 0600U);
}

TEST_F(EtcdLastKnown, IsRefusedWhereverAByteIsOtherwise) {
    writeLastKnown(file.path(), "p/", sample());
    const std::string good = bytes();
    for (std::size_t i = 0; i < good.size(); ++i) {
        std::string bad = good;
        bad[i] = static_cast<char>(bad[i] ^ 1);
        file.rewrite(bad);
        EXPECT_NE(problem(), "<nothing thrown>") << i;
    }
}

TEST_F(EtcdLastKnown, IsRefusedWhereverItEnds) {
    writeLastKnown(file.path(), "p/", sample());
    const std::string good = bytes();
    for (std::size_t size = 0; size < good.size(); ++size) {
        file.rewrite(good.substr(0, size));
        EXPECT_NE(problem(), "<nothing thrown>") << size;
    }
}

TEST_F(EtcdLastKnown, SaysWhatIsWrong) {
    EXPECT_EQ(problem(), text("it is of another program"));
    writeLastKnown(file.path(), "p/", sample());
    EXPECT_EQ(problem("q/"), text("it is of another prefix"));
    file.rewrite(bytes() + "x");
    EXPECT_EQ(problem(), text("it is damaged"));
    std::filesystem::remove(file.path());
    EXPECT_EQ(problem(), text("No such file or directory"));
}

TEST_F(EtcdLastKnown, IsForItsOwnerAloneWhateverStoodBesideIt) {
    const std::string beside = file.path().string() + ".new";
    std::ofstream(beside) << "foreign";
    ASSERT_EQ(::chmod(beside.c_str(), 0666), 0);
    writeLastKnown(file.path(), "p/", sample());
    struct stat status {};
    ASSERT_EQ(::stat(file.path().c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 0777U, 0600U);
}

TEST_F(EtcdLastKnown, FollowsNoLinkThatStandsBesideIt) {
    const auto other = file.parent() / "other";
    std::ofstream(other) << "foreign";
    std::filesystem::create_symlink(other, file.path().string() + ".new");
    writeLastKnown(file.path(), "p/", sample());
    EXPECT_EQ(std::filesystem::file_size(other), 7U);
    EXPECT_TRUE(readLastKnown(file.path(), "p/").values == sample().values);
}

TEST_F(EtcdLastKnown, LeavesNothingBesideItWhenItCannotBeReplaced) {
    std::filesystem::remove(file.path());
    std::filesystem::create_directory(file.path());
    EXPECT_EQ(thrownText<std::runtime_error>([&] { writeLastKnown(file.path(), "", {}); }),
              text("Is a directory"));
    EXPECT_FALSE(std::filesystem::exists(file.path().string() + ".new"));
}

TEST_F(EtcdLastKnown, IsReadFromAFileOnly) {
    std::filesystem::remove(file.path());
    std::filesystem::create_directory(file.path());
    EXPECT_EQ(problem(), text("it is no file"));
    std::filesystem::remove(file.path());
    ASSERT_EQ(::mkfifo(file.path().c_str(), 0600), 0);
    EXPECT_EQ(problem(), text("it is no file")) << "does not wait for somebody who writes";
}

TEST_F(EtcdLastKnown, SaysWhyItCannotBeWritten) {
    const auto nowhere = file.parent() / "none" / "file";
    EXPECT_EQ(thrownText<std::runtime_error>([&] { writeLastKnown(nowhere, "", {}); }),
              nowhere.string() + ".new: No such file or directory");
}

}  // namespace
}  // namespace velkor::layers::etcd
