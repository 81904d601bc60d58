#include "host/console/Announcements.hpp"

#include <gtest/gtest.h>
#include <poll.h>

#include <sstream>
#include <string>
#include <thread>

namespace velkor::host {
namespace {

class AnnouncementsTest : public ::testing::Test {
protected:
    bool hasSomething() const {
        pollfd event{announcements.descriptor(), POLLIN, 0};
        return ::poll(&event, 1, 0) == 1;
    }

    std::ostringstream answers;
    std::ostringstream messages;
    Output output{answers, Output::Answers::exact, messages};
    Announcements announcements{output};
};

TEST_F(AnnouncementsTest, AreShownAtOnceWhileNoLineIsEdited) {
    announcements.announce("a");
    EXPECT_EQ(answers.str(), "a\n");
    EXPECT_FALSE(hasSomething());
}

TEST_F(AnnouncementsTest, WaitForTheEditor) {
    announcements.beginEditing();
    announcements.announce("a");
    announcements.announce("b");
    EXPECT_EQ(answers.str(), "");
    EXPECT_TRUE(hasSomething());
    announcements.show();
    EXPECT_EQ(answers.str(), "a\nb\n");
    EXPECT_FALSE(hasSomething());
}

TEST_F(AnnouncementsTest, WaitForTheEndOfTheLineAtMost) {
    announcements.beginEditing();
    announcements.announce("a");
    announcements.endEditing();
    EXPECT_EQ(answers.str(), "a\n");
    EXPECT_FALSE(hasSomething());
    announcements.announce("b");
    EXPECT_EQ(answers.str(), "a\nb\n");
}

TEST_F(AnnouncementsTest, WaitAgainWithTheNextLine) {
    announcements.beginEditing();
    announcements.endEditing();
    announcements.beginEditing();
    announcements.announce("a");
    EXPECT_EQ(answers.str(), "");
}

TEST_F(AnnouncementsTest, AreDroppedOnceClosed) {
    announcements.beginEditing();
    announcements.announce("a");
    announcements.close();
    announcements.announce("b");
    announcements.endEditing();
    announcements.announce("c");
    EXPECT_EQ(answers.str(), "");
}

TEST_F(AnnouncementsTest, OfOneThreadKeepTheirOrderWhateverIsEdited) {
    constexpr int count = 2000;
    std::thread other([this] {
        for (int i = 0; i < count; ++i) announcements.announce(std::to_string(i));
    });
    for (int i = 0; i < count; ++i) {
        announcements.beginEditing();
        announcements.show();
        announcements.endEditing();
    }
    other.join();
    std::string expected;
    for (int i = 0; i < count; ++i) expected += std::to_string(i) + '\n';
    EXPECT_EQ(answers.str(), expected);
}

}  // namespace
}  // namespace velkor::host
