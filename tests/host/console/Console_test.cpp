#include "host/console/Console.hpp"

#include <gtest/gtest.h>

#include <csignal>
#include <memory>
#include <sstream>
#include <stdexcept>
#include <string>
#include <vector>

#include "host/console/GivenLines.hpp"
#include "host/console/Interruption.hpp"
#include "host/console/LineReader.hpp"

namespace velkor::host {
namespace {

using Words = std::vector<std::string>;

class ConsoleTest : public ::testing::Test {
protected:
    ConsoleTest() {
        registry->registerCommand({"host.echo", "",
                                   [](Words&& arguments) {
                                       std::string text;
                                       for (const auto& each : arguments) text += '<' + each + '>';
                                       return text;
                                   },
                                   0, 2});
        add("fail", [](Words&&) -> std::string { throw std::runtime_error("no luck"); });
        add("refuse", [](Words&&) -> std::string { throw CommandError("Not so."); });
        add("confuse", [](Words&&) -> std::string { throw 5; });
        add("quit", [this](Words&&) {
            console.quit();
            return std::string("bye");
        });
    }

    void add(const std::string& name, administration::CommandHandler handler) {
        registry->registerCommand({name, "", std::move(handler), 0, 0});
    }

    bool run(const Words& lines) {
        GivenLines given(lines);
        return console.run(given);
    }

    std::ostringstream answers;
    std::ostringstream messages;
    Output output{answers, Output::Answers::exact, messages};
    std::shared_ptr<CommandRegistry> registry = std::make_shared<CommandRegistry>();
    Console console{registry, output};
};

TEST_F(ConsoleTest, ShowsAnAnswerOnceItIsAcknowledged) {
    std::string shownBefore;
    Console acknowledging(registry, output, [&] { shownBefore += answers.str() + '|'; });
    GivenLines lines({"echo a", "echo b"});
    EXPECT_TRUE(acknowledging.run(lines));
    EXPECT_EQ(shownBefore, "|<a>\n|");
    EXPECT_EQ(answers.str(), "<a>\n<b>\n");
}

TEST_F(ConsoleTest, ShowsWhyACommandIsNotAcknowledged) {
    Console refusing(registry, output, [] { throw std::runtime_error("no luck"); });
    GivenLines lines({"echo a"});
    EXPECT_FALSE(refusing.run(lines));
    EXPECT_EQ(answers.str(), "");
    EXPECT_EQ(messages.str(), "velkor-config: host.echo: no luck\n");
}

TEST_F(ConsoleTest, AWaitForAnAcknowledgementThatIsInterruptedIsNoFailure) {
    Console interrupted(registry, output, [] { throw Interrupted(); });
    GivenLines lines({"echo a"});
    EXPECT_TRUE(interrupted.run(lines));
    EXPECT_EQ(answers.str() + messages.str(), "");
}

TEST_F(ConsoleTest, ShowsTheAnswersInTheOrderOfTheLines) {
    EXPECT_TRUE(run({"echo a 'b c'", "host.echo d"}));
    EXPECT_EQ(answers.str(), "<a><b c>\n<d>\n");
    EXPECT_EQ(messages.str(), "");
}

TEST_F(ConsoleTest, PassesOverEmptyLinesAndComments) {
    EXPECT_TRUE(run({"", " \t\r", "# echo a", "  #", "echo '#b' #c"}));
    EXPECT_EQ(answers.str(), "<#b><#c>\n");
}

TEST_F(ConsoleTest, ReportsAnUnknownCommandAndGoesOn) {
    EXPECT_FALSE(run({"ecko", "echo a"}));
    EXPECT_EQ(messages.str(), "velkor-config: Unknown command: ecko (did you mean: echo?)\n");
    EXPECT_EQ(answers.str(), "<a>\n");
}

TEST_F(ConsoleTest, ReportsAWrongNumberOfArgumentsAndGoesOn) {
    EXPECT_FALSE(run({"echo a b c", "echo a"}));
    EXPECT_EQ(messages.str(), "velkor-config: host.echo takes at most 2 arguments; given: 3\n");
    EXPECT_EQ(answers.str(), "<a>\n");
}

TEST_F(ConsoleTest, ReportsAnUnbalancedQuoteAndGoesOn) {
    EXPECT_FALSE(run({"echo 'a", "echo a"}));
    EXPECT_EQ(messages.str(), "velkor-config: Unbalanced quote: '\n");
    EXPECT_EQ(answers.str(), "<a>\n");
}

TEST_F(ConsoleTest, NamesTheCommandWhoseHandlerThrows) {
    EXPECT_FALSE(run({"fail", "echo a"}));
    EXPECT_EQ(messages.str(), "velkor-config: fail: no luck\n");
    EXPECT_EQ(answers.str(), "<a>\n");
}

TEST_F(ConsoleTest, ReportsWhatIsNoException) {
    EXPECT_FALSE(run({"confuse"}));
    EXPECT_EQ(messages.str(), "velkor-config: confuse: unknown error\n");
}

TEST_F(ConsoleTest, ReportsARefusalInItsOwnWords) {
    EXPECT_FALSE(run({"refuse"}));
    EXPECT_EQ(messages.str(), "velkor-config: Not so.\n");
}

TEST_F(ConsoleTest, OneFailureIsNotForgotten) {
    EXPECT_FALSE(run({"fail", "echo", "echo"}));
}

TEST_F(ConsoleTest, EndsAfterQuit) {
    EXPECT_TRUE(run({"quit", "echo a"}));
    EXPECT_EQ(answers.str(), "bye\n");
}

TEST_F(ConsoleTest, MayRunAgainAfterQuit) {
    run({"quit"});
    run({"echo a"});
    EXPECT_EQ(answers.str(), "bye\n<a>\n");
}

TEST_F(ConsoleTest, EndsWhenNobodyReadsTheAnswers) {
    int calls = 0;
    add("count", [&calls](Words&&) { return std::to_string(++calls); });
    answers.setstate(std::ios::badbit);
    EXPECT_TRUE(run({"count", "count"}));
    EXPECT_EQ(calls, 1);
}

TEST_F(ConsoleTest, ACommandThatIsInterruptedHasNotFailed) {
    const Interruption interruption;
    add("list", [](Words&&) -> std::string {
        std::raise(SIGINT);
        throw Interrupted();
    });
    EXPECT_TRUE(run({"list", "echo a"}));
    EXPECT_EQ(messages.str(), "");
    EXPECT_EQ(answers.str(), "\n<a>\n");
}

TEST_F(ConsoleTest, DropsTheAnswerOfACommandThatIsInterrupted) {
    const Interruption interruption;
    add("list", [](Words&&) {
        std::raise(SIGINT);
        return std::string("b");
    });
    EXPECT_TRUE(run({"list", "echo a"}));
    EXPECT_EQ(answers.str(), "\n<a>\n");
}

TEST_F(ConsoleTest, AnInterruptionBeforeTheCommandsEndsNone) {
    const Interruption interruption;
    std::raise(SIGINT);
    EXPECT_TRUE(run({"echo a"}));
    EXPECT_EQ(answers.str(), "<a>\n");
}

TEST_F(ConsoleTest, SaysWhichLineOfTheInputFailed) {
    std::istringstream in("echo a\n\nnope\n");
    LineReader reader(in);
    EXPECT_FALSE(console.run(reader));
    EXPECT_EQ(messages.str(), "velkor-config: line 3: Unknown command: nope\n");
}

TEST_F(ConsoleTest, GoesOnAfterALineThatIsTooLong) {
    std::istringstream in(std::string(LineReader::longestLine + 1, 'x') + "\necho a\n");
    LineReader reader(in);
    EXPECT_FALSE(console.run(reader));
    EXPECT_EQ(messages.str(),
              "velkor-config: line 1: Line too long; the limit is 1048576 bytes.\n");
    EXPECT_EQ(answers.str(), "<a>\n");
}

}  // namespace
}  // namespace velkor::host
