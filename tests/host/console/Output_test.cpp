#include "host/console/Output.hpp"

#include <gtest/gtest.h>

#include <cerrno>
#include <csignal>
#include <sstream>
#include <streambuf>
#include <string>

#include "host/console/Interruption.hpp"

namespace velkor::host {
namespace {

using namespace std::string_literals;

class OutputTest : public ::testing::Test {
protected:
    std::ostringstream answers;
    std::ostringstream messages;
    Output exact{answers, Output::Answers::exact, messages};
    Output escaped{answers, Output::Answers::escaped, messages};
};

TEST_F(OutputTest, EndsAnAnswerWithALineFeed) {
    exact.answer("9090");
    EXPECT_EQ(answers.str(), "9090\n");
}

TEST_F(OutputTest, AddsNoSecondLineFeed) {
    exact.answer("a = 1\n");
    EXPECT_EQ(answers.str(), "a = 1\n");
}

TEST_F(OutputTest, WritesNothingForAnEmptyAnswer) {
    exact.answer("");
    EXPECT_EQ(answers.str(), "");
}

TEST_F(OutputTest, WritesAnswersByteForByte) {
    exact.answer("\x1b[31m\0\xff\r"s);
    EXPECT_EQ(answers.str(), "\x1b[31m\0\xff\r\n"s);
}

TEST_F(OutputTest, EscapesControlCharactersOfAnswersOnATerminal) {
    escaped.answer("'\x1b[31m'\nb\t");
    EXPECT_EQ(answers.str(), "'\\x1b[31m'\nb\\t\n");
}

TEST_F(OutputTest, WritesAMessageAsOneLine) {
    exact.message("Unknown command: a\nb\x1b");
    EXPECT_EQ(messages.str(), "velkor-config: Unknown command: a\\nb\\x1b\n");
    EXPECT_EQ(answers.str(), "");
}

TEST_F(OutputTest, IsOpenAtFirst) {
    EXPECT_TRUE(exact.isOpen());
    EXPECT_EQ(exact.failure(), 0);
}

class FullDisk : public std::streambuf {
    int sync() override {
        errno = ENOSPC;
        return -1;
    }
    int_type overflow(int_type byte) override { return traits_type::not_eof(byte); }
};

TEST_F(OutputTest, RemembersWhyAnswersNoLongerArrive) {
    FullDisk disk;
    std::ostream full(&disk);
    Output output(full, Output::Answers::exact, messages);
    output.answer("a");
    EXPECT_FALSE(output.isOpen());
    EXPECT_EQ(output.failure(), ENOSPC);
}

TEST_F(OutputTest, HasAReasonWhereTheSystemGivesNone) {
    answers.setstate(std::ios::badbit);
    exact.answer("a");
    EXPECT_EQ(exact.failure(), EIO);
}

TEST_F(OutputTest, DropsAnAnswerThatIsInterruptedAndStaysOpen) {
    const Interruption interruption;
    std::raise(SIGINT);
    exact.answer("a");
    Interruption::take();
    exact.answer("b");
    EXPECT_EQ(answers.str(), "b\n");
    EXPECT_TRUE(exact.isOpen());
}

// Ctrl-C is pressed while a text is written.
class InterruptedTerminal : public std::streambuf {
    std::streamsize xsputn(const char*, std::streamsize) override {
        std::raise(SIGINT);
        errno = EINTR;
        return 0;
    }
};

TEST_F(OutputTest, StaysOpenWhenWritingIsInterrupted) {
    const Interruption interruption;
    InterruptedTerminal terminal;
    std::ostream stream(&terminal);
    Output output(stream, Output::Answers::exact, messages);
    output.answer("a");
    EXPECT_TRUE(output.isOpen());
    EXPECT_TRUE(stream.good());
}

TEST(Output, PaintsLinesOfEscapedAnswersWhereThereAreColours) {
    std::ostringstream answers;
    std::ostringstream messages;
    Output output(answers, Output::Answers::coloured, messages);
    output.answer("a = '\x1b[31m'\nb = 1", paintOption);
    output.answer("plain = 1");
    EXPECT_EQ(answers.str(), "a = \x1b[32m'\\x1b[31m'\x1b[0m\nb = \x1b[36m1\x1b[0m\nplain = 1\n");
}

TEST(Output, PaintsNothingWhereThereAreNoColours) {
    for (const auto form : {Output::Answers::exact, Output::Answers::escaped}) {
        std::ostringstream answers;
        std::ostringstream messages;
        Output(answers, form, messages).answer("a = 1\n", paintOption);
        EXPECT_EQ(answers.str(), "a = 1\n");
    }
}

}  // namespace
}  // namespace velkor::host
