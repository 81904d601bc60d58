#include "tests/layers/faults/SimulatedDisk.hpp"

#include <gtest/gtest.h>

#include <set>
#include <string>
#include <thread>

namespace velkor::testing {
namespace {

constexpr std::size_t sector = SimulatedFile::sectorSize;

class SimulatedDiskTest : public ::testing::Test {
protected:
    SimulatedDisk::OpenFile opened(const std::string& name = "file") {
        SimulatedDisk::OpenFile file;
        EXPECT_EQ(disk.open(name, true, file), DiskAnswer::done);
        return file;
    }

    DiskAnswer write(const SimulatedDisk::OpenFile& file, const std::string& text,
                     std::size_t offset = 0) {
        return disk.write(file, offset, reinterpret_cast<const unsigned char*>(text.data()),
                          text.size());
    }

    std::string contentOf(const SimulatedDisk::OpenFile& file) {
        std::string content(disk.size(file), '\0');
        disk.read(file, 0, reinterpret_cast<unsigned char*>(content.data()), content.size());
        return content;
    }

    /// What the file holds after `change` and a power cut, for many seeds.
    template <class Change>
    std::set<std::string> leftAfter(Change change) {
        std::set<std::string> left;
        for (std::uint64_t seed = 1; seed <= 100; ++seed) {
            SimulatedDisk::OpenFile file = opened();
            file.syncsFolder = true;
            disk.resize(file, 0);
            write(file, std::string(2 * sector, 'a'));
            disk.sync(file);
            change(file);
            Random random(seed);
            disk.restartAfterPowerCut(random);
            left.insert(contentOf(opened()));
        }
        return left;
    }

    SimulatedDisk disk;
};

std::string sectors(char first, char second) {
    return std::string(sector, first) + std::string(sector, second);
}

TEST_F(SimulatedDiskTest, KeepsWhatWasSynced) {
    const auto left = leftAfter([this](SimulatedDisk::OpenFile& file) {
        write(file, "b");
        disk.sync(file);
    });
    EXPECT_EQ(left, std::set<std::string>{"b" + sectors('a', 'a').substr(1)});
}

TEST_F(SimulatedDiskTest, KeepsOrLosesEachSectorThatWasNotSynced) {
    const auto left = leftAfter(
        [this](SimulatedDisk::OpenFile& file) { write(file, std::string(2 * sector, 'b')); });
    EXPECT_EQ(left, (std::set<std::string>{sectors('a', 'a'), sectors('a', 'b'), sectors('b', 'a'),
                                           sectors('b', 'b')}));
}

TEST_F(SimulatedDiskTest, KeepsAnyVersionOfASectorSinceItsSync) {
    const auto left = leftAfter([this](SimulatedDisk::OpenFile& file) {
        write(file, std::string(sector, 'b'));
        write(file, std::string(sector, 'c'));
    });
    EXPECT_EQ(left,
              (std::set<std::string>{sectors('a', 'a'), sectors('b', 'a'), sectors('c', 'a')}));
}

TEST_F(SimulatedDiskTest, IsNoSurerOfWhatCouldNotBeSyncedAfterTheNextSync) {
    const auto left = leftAfter([this](SimulatedDisk::OpenFile& file) {
        write(file, sectors('b', 'b'));
        disk.fail({DiskOperation::sync});
        disk.sync(file);
        write(file, std::string(sector, 'c'));
        disk.sync(file);
    });
    EXPECT_EQ(left, (std::set<std::string>{sectors('c', 'a'), sectors('c', 'b')}));
}

TEST_F(SimulatedDiskTest, KeepsOrLosesAChangeOfTheSize) {
    const auto left =
        leftAfter([this](SimulatedDisk::OpenFile& file) { disk.resize(file, sector); });
    EXPECT_EQ(left, (std::set<std::string>{sectors('a', 'a'), std::string(sector, 'a')}));
}

TEST_F(SimulatedDiskTest, FillsLostSectorsOfAFileThatHasGrownWithZeros) {
    const auto left = leftAfter([this](SimulatedDisk::OpenFile& file) {
        write(file, std::string(sector, 'b'), 2 * sector);
    });
    EXPECT_EQ(left.count(sectors('a', 'a') + std::string(sector, '\0')), 1U);
}

TEST_F(SimulatedDiskTest, KeepsOrLosesTheNameOfANewFile) {
    std::set<bool> left;
    for (std::uint64_t seed = 1; seed <= 100; ++seed) {
        opened("new");
        Random random(seed);
        disk.restartAfterPowerCut(random);
        left.insert(disk.has("new"));
        disk.remove("new", true);
    }
    EXPECT_EQ(left, (std::set<bool>{false, true}));
}

TEST_F(SimulatedDiskTest, KeepsTheNamesThatWereSynced) {
    SimulatedDisk::OpenFile file = opened("new");
    file.syncsFolder = true;
    disk.sync(file);
    for (std::uint64_t seed = 1; seed <= 100; ++seed) {
        Random random(seed);
        disk.restartAfterPowerCut(random);
        EXPECT_TRUE(disk.has("new"));
    }
}

TEST_F(SimulatedDiskTest, KeepsEverythingWhenItsProgramsDie) {
    write(opened(), "text");
    disk.restartAfterKill();
    EXPECT_EQ(contentOf(opened()), "text");
}

TEST_F(SimulatedDiskTest, SyncsWhatADeadProgramHasWritten) {
    const auto left = leftAfter([this](SimulatedDisk::OpenFile& file) {
        write(file, sectors('b', 'b'));
        disk.restartAfterKill();
        disk.sync(file);
        SimulatedDisk::OpenFile again = opened();
        disk.sync(again);
    });
    EXPECT_EQ(left, std::set<std::string>{sectors('b', 'b')});
}

TEST_F(SimulatedDiskTest, AnswersNothingOpenedBeforeAStart) {
    const SimulatedDisk::OpenFile file = opened();
    disk.restartAfterKill();
    EXPECT_EQ(write(file, "text"), DiskAnswer::failed);
}

TEST_F(SimulatedDiskTest, DoesNothingMoreFromThePowerCutOn) {
    disk.cutPowerAfter(1);
    SimulatedDisk::OpenFile file = opened();
    EXPECT_EQ(write(file, "done"), DiskAnswer::done);
    EXPECT_EQ(write(file, "lost"), DiskAnswer::failed);
    EXPECT_EQ(disk.sync(file), DiskAnswer::failed);
    EXPECT_FALSE(disk.hasPower());
}

TEST_F(SimulatedDiskTest, FailsTheOperationThatItIsToldTo) {
    disk.fail({DiskOperation::write, DiskAnswer::full, 1});
    SimulatedDisk::OpenFile file = opened();
    EXPECT_EQ(write(file, "first"), DiskAnswer::done);
    EXPECT_EQ(disk.sync(file), DiskAnswer::done);
    EXPECT_EQ(write(file, "second"), DiskAnswer::full);
    EXPECT_EQ(write(file, "third"), DiskAnswer::done);
    EXPECT_TRUE(disk.recover());
}

TEST_F(SimulatedDiskTest, FailsUntilItRecoversWhenTheFaultLasts) {
    disk.fail({DiskOperation::write, DiskAnswer::failed, 0, true});
    const SimulatedDisk::OpenFile file = opened();
    EXPECT_EQ(write(file, "first"), DiskAnswer::failed);
    EXPECT_EQ(write(file, "second"), DiskAnswer::failed);
    EXPECT_TRUE(disk.recover());
    EXPECT_EQ(write(file, "third"), DiskAnswer::done);
}

TEST_F(SimulatedDiskTest, DoesHalfOfAWriteThatFindsNoSpaceForTheRest) {
    disk.fail({DiskOperation::write, DiskAnswer::partlyDone});
    const SimulatedDisk::OpenFile file = opened();
    EXPECT_EQ(write(file, "half"), DiskAnswer::partlyDone);
    EXPECT_EQ(contentOf(file), "ha");
}

TEST_F(SimulatedDiskTest, HoldsWritesUpUntilTheyMayGoOn) {
    const SimulatedDisk::OpenFile file = opened();
    disk.hold();
    std::thread writer([&] { write(file, "text"); });
    disk.waitUntilHolding();
    EXPECT_EQ(contentOf(file), "");
    disk.letGo();
    writer.join();
    EXPECT_EQ(contentOf(file), "text");
}

}  // namespace
}  // namespace velkor::testing
