#include "host/console/StreamedAnswer.hpp"

#include <gtest/gtest.h>

#include <csignal>
#include <memory>
#include <sstream>
#include <stdexcept>
#include <string>

#include "host/console/Console.hpp"
#include "host/console/GivenLines.hpp"
#include "host/console/Interruption.hpp"

namespace velkor::host {
namespace {

class StreamedAnswerTest : public ::testing::Test {
protected:
    bool run(const StreamingHandler& handler) {
        CommandTraits traits;
        traits.stream = handler;
        registry->add(std::make_shared<const Command>(
            administration::CommandDescriptor{"test", "", nullptr, 0, 1}, std::move(traits)));
        GivenLines lines({"test x"});
        return Console(registry, output).run(lines);
    }

    std::ostringstream answers;
    std::ostringstream messages;
    Output output{answers, Output::Answers::exact, messages};
    StreamedAnswer answer{output};
    std::shared_ptr<CommandRegistry> registry = std::make_shared<CommandRegistry>();
};

TEST_F(StreamedAnswerTest, ShowsTheFirstLineAtOnce) {
    answer.line("a");
    EXPECT_EQ(answers.str(), "a\n");
}

TEST_F(StreamedAnswerTest, PaintsEachLineWhereThereAreColours) {
    Output colours(answers, Output::Answers::coloured, messages);
    StreamedAnswer painted(colours,
                           [](std::string_view line) { return '<' + std::string(line) + '>'; });
    painted.line("a");
    painted.line("b");
    painted.line("c");
    painted.flush();
    EXPECT_EQ(answers.str(), "<a>\n<b>\n<c>\n");
}

TEST_F(StreamedAnswerTest, ShowsWhatFollowsInBlocks) {
    answer.line("a");
    answer.line("b");
    EXPECT_EQ(answers.str(), "a\n");
    answer.line(std::string(100'000, 'c'));
    EXPECT_EQ(answers.str().size(), 100'005U);
    answer.line("d");
    answer.flush();
    EXPECT_EQ(answers.str().substr(100'005), "d\n");
}

TEST_F(StreamedAnswerTest, ShowsWhatIsNotedBehindWhatWasWritten) {
    answer.line("a");
    answer.line("b");
    answer.note("so");
    EXPECT_EQ(answers.str(), "a\nb\n");
    EXPECT_EQ(messages.str(), "velkor-config: so\n");
}

TEST_F(StreamedAnswerTest, EndsWhereNobodyReadsIt) {
    answers.setstate(std::ios::badbit);
    EXPECT_THROW(answer.line("a"), Interrupted);
}

TEST_F(StreamedAnswerTest, EndsAtControlC) {
    const Interruption interruption;
    std::raise(SIGINT);
    EXPECT_THROW(answer.line("a"), Interrupted);
}

TEST_F(StreamedAnswerTest, IsThatOfACommandThatWritesAsItGoes) {
    std::string seen;
    EXPECT_TRUE(run([&](std::vector<std::string>&& arguments, CommandOutput& out) {
        out.line(arguments.at(0));
        seen = answers.str();
        out.line("z");
    }));
    EXPECT_EQ(seen, "x\n");
    EXPECT_EQ(answers.str(), "x\nz\n");
}

TEST_F(StreamedAnswerTest, KeepsWhatACommandHadWrittenWhenItFails) {
    EXPECT_FALSE(run([](auto&&, CommandOutput& out) {
        out.line("a");
        out.line("b");
        throw std::runtime_error("no luck");
    }));
    EXPECT_EQ(answers.str(), "a\nb\n");
    EXPECT_EQ(messages.str(), "velkor-config: test: no luck\n");
}

TEST_F(StreamedAnswerTest, DropsTheRestOfACommandThatIsInterrupted) {
    EXPECT_TRUE(run([](auto&&, CommandOutput& out) {
        out.line("a");
        out.line("b");
        throw Interrupted();
    }));
    EXPECT_EQ(answers.str(), "a\n");
    EXPECT_EQ(messages.str(), "");
}

}  // namespace
}  // namespace velkor::host
