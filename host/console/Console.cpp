#include "host/console/Console.hpp"

#include <exception>
#include <utility>

#include "host/console/CommandLine.hpp"
#include "host/console/Interruption.hpp"
#include "host/console/StreamedAnswer.hpp"

namespace velkor::host {

namespace {

constexpr char commentMark = '#';

bool isComment(const std::string& line, const CommandLine& words) {
    return line[words.wordStart()] == commentMark;
}

/// What a handler threw, so that the message can name the command.
std::string failureText(const Command& command) {
    try {
        throw;
    } catch (const CommandError& error) {
        return error.what();
    } catch (const std::exception& error) {
        return command.name() + ": " + error.what();
    } catch (...) {
        return command.name() + ": unknown error";
    }
}

}  // namespace

Console::Console(std::shared_ptr<const CommandRegistry> commandRegistry, Output& consoleOutput,
                 std::function<void()> acknowledgeCommand)
    : registry(std::move(commandRegistry)),
      output(consoleOutput),
      acknowledge(std::move(acknowledgeCommand)) {}

bool Console::run(LineSource& lines) {
    quitting = false;
    bool allFine = true;
    while (!quitting && output.isOpen()) {
        try {
            if (!runNext(lines)) break;
        } catch (const std::exception& error) {
            allFine = false;
            output.message(lines.position() + error.what());
        }
        // What was interrupted may have left the cursor in the middle of a line.
        if (Interruption::take()) output.answer("\n");
    }
    return allFine;
}

bool Console::run(const std::vector<std::string>& words) {
    bool isFine = true;
    try {
        const auto command = registry->find(words.at(0));
        carryOut(*command, command->givenArguments({words.begin() + 1, words.end()}));
    } catch (const std::exception& error) {
        isFine = false;
        remarks.clear();
        output.message(error.what());
    }
    showRemarks("");
    return isFine;
}

bool Console::runNext(LineSource& lines) {
    const auto line = lines.nextLine();
    Interruption::take();  // what came before the command is not about it
    if (line) execute(*line);
    showRemarks(lines.position());
    return line.has_value();
}

void Console::execute(const std::string& line) {
    remarks.clear();
    CommandLine words(line);
    const auto name = words.nextWord();
    if (!name || isComment(line, words)) return;
    const auto command = registry->find(*name);
    carryOut(*command, command->readArguments(words));
}

void Console::carryOut(const Command& command, std::vector<std::string>&& arguments) {
    const Paint paint = paintOf(command.name());
    StreamedAnswer streamed(output, paint);
    std::string answer;
    try {
        answer = command.run(std::move(arguments), streamed);
        acknowledge();
    } catch (const Interrupted&) {
        return;
    } catch (...) {
        streamed.flush();
        throw CommandError(failureText(command));
    }
    streamed.flush();
    output.answer(answer, paint);
}

void Console::showRemarks(const std::string& position) {
    for (const auto& remark : remarks) output.message(position + remark);
    remarks.clear();
}

}  // namespace velkor::host
