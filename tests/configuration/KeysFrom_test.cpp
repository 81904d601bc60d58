#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <memory>
#include <random>
#include <string>
#include <vector>

#include "configuration/sources/PropertyFileSource.hpp"
#include "tests/configuration/StoreTesting.hpp"

namespace velkor::configuration {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;
using Keys = std::vector<std::string>;

class KeysFrom : public testing::StoreTest {
protected:
    Keys keysFrom(const std::string& first, std::size_t most) const {
        return store->keysFrom(first, most).get();
    }

    /// All keys, `most` at a time.
    Keys inPagesOf(std::size_t most) const {
        Keys all;
        std::string first;
        for (Keys page; !(page = keysFrom(first, most)).empty(); first = all.back() + '\0') {
            all.insert(all.end(), page.begin(), page.end());
        }
        return all;
    }

    Keys allKeys() const {
        const auto keys = store->keys().get();
        return {keys.begin(), keys.end()};
    }

    void addFile(const std::string& name, const std::string& group, const std::string& text) const {
        store->addSource(name, group, 5, true,
                         std::make_shared<PropertyFileSource>(PropertyText{text}));
    }
};

TEST_F(KeysFrom, AreNoneInAnEmptyStore) {
    EXPECT_THAT(keysFrom("", 10), IsEmpty());
}

TEST_F(KeysFrom, AreNoneOfAnEmptyFile) {
    addFile("file", "", "# nothing\n");
    EXPECT_THAT(keysFrom("", 10), IsEmpty());
}

TEST_F(KeysFrom, AreTheSmallestThatAreNotLess) {
    add("one", "", 5, {{"d", 1}, {"b", 1}, {"c", 1}, {"a", 1}});
    EXPECT_THAT(keysFrom("", 2), ElementsAre("a", "b"));
    EXPECT_THAT(keysFrom("b", 2), ElementsAre("b", "c"));
    EXPECT_THAT(keysFrom("bb", 10), ElementsAre("c", "d"));
    EXPECT_THAT(keysFrom("e", 10), IsEmpty());
}

TEST_F(KeysFrom, HaveTheirGroups) {
    add("one", "b", 5, {{"x", 1}, {"", 1}});
    add("two", "", 5, {{"b", 1}, {"b.a", 1}, {"b.y", 1}, {"c", 1}});
    EXPECT_THAT(keysFrom("", 10), ElementsAre("b", "b.", "b.a", "b.x", "b.y", "c"));
    EXPECT_THAT(keysFrom("b.b", 2), ElementsAre("b.x", "b.y"));
}

TEST_F(KeysFrom, AreGivenOnceWhoeverHoldsThem) {
    add("one", "a", 5, {{"x", 1}, {"y", 1}});
    addFile("two", "", "a.x=1\na.x=2\na.x=3\na.z=1\n");
    addHooked("three", "a", 5, {{"x", 1}, {"w", 1}});
    EXPECT_THAT(inPagesOf(1), ElementsAre("a.w", "a.x", "a.y", "a.z"));
    EXPECT_THAT(inPagesOf(3), ElementsAre("a.w", "a.x", "a.y", "a.z"));
}

TEST_F(KeysFrom, AreComparedByteByByte) {
    addFile("one", "", "\\u00e9=1\nz=1\nZ=1\n\xFF=1\n");
    EXPECT_EQ(inPagesOf(1), allKeys());
}

TEST_F(KeysFrom, AreAllKeysWhateverTheirOrderAndThePagesAre) {
    std::mt19937 random(7);  // NOLINT(cert-msc51-cpp): every run has the same keys
    std::string ascending;
    std::string descending;
    std::string shuffled;
    for (int number = 0; number < 2000; ++number) {
        ascending += "up" + std::to_string(10000 + number) + "=1\n";
        descending += "down" + std::to_string(90000 - number) + "=1\n";
        shuffled += std::to_string(random() % 3000) + "=1\n";
    }
    addFile("ascending", "", ascending);
    addFile("descending", "u", descending);
    addFile("shuffled", "up1", shuffled);
    for (const std::size_t most : {1U, 7U, 100U, 4096U, 100000U})
        EXPECT_EQ(inPagesOf(most), allKeys());
}

}  // namespace
}  // namespace velkor::configuration
