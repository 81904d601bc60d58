#include "host/Session.hpp"

#include <unistd.h>

#include <exception>
#include <iostream>
#include <map>
#include <stdexcept>
#include <utility>

#include "configuration/admin/TypedText.hpp"
#include "host/LoginName.hpp"
#include "host/Manual.hpp"
#include "host/MisplacedCommands.hpp"
#include "host/TerminalText.hpp"
#include "host/console/ArgumentWords.hpp"
#include "host/console/Completer.hpp"
#include "host/console/GivenLines.hpp"
#include "host/console/LineHistory.hpp"
#include "host/console/LineReader.hpp"
#include "host/console/SecretLines.hpp"
#include "host/console/SendCommand.hpp"
#include "host/console/StoreCommandRegistry.hpp"
#include "host/console/ValueWords.hpp"
#include "host/look/JsonAnswers.hpp"
#include "host/serving/Serving.hpp"
#include "host/state/StateLayer.hpp"
#include "settings/Describe.hpp"
#include "settings/Secrets.hpp"

namespace velkor::host {

namespace {

constexpr const char* greeting =
    "velkor-config " VELKOR_VERSION ": 'help' lists the commands, 'quit' ends the session.";

}  // namespace

bool commandsAreTyped() {
    return isatty(STDIN_FILENO) == 1 && isatty(STDOUT_FILENO) == 1;
}

Session::Session(Output& sessionOutput, const SourceLimits& sourceLimits)
    : output(sessionOutput),
      announcements(std::make_shared<Announcements>(output)),
      store(std::make_shared<SessionStore>(sourceLimits)),
      sources(std::make_shared<SessionSources>(
          store, sourceLimits, [this](const auto& notice) { output.message(notice); })),
      watches(std::make_shared<Watches>(store, showValue(optionText))),
      registry(std::make_shared<CommandRegistry>()),
      console(registry, output, [this] { store->acknowledge(); }),
      service(store, {}, secretsOf(store)),
      storeCommands(store, std::make_shared<StoreCommandRegistry>(
                               store, registry,
                               [this](std::string text) { console.remark(std::move(text)); })),
      lookCommands(store, registry),
      hostCommands(services(), registry) {}

// Threads of sources may be about to announce something still.
Session::~Session() {
    announcements->close();
}

HostServices Session::services() {
    HostServices services{store, watches, service.dispatcherFor(messages::allRequestTypes()),
                          [this] { console.quit(); }};
    services.sources = sources;
    services.showJson = showValue(watchedJson);
    return services;
}

bool Session::keepStateIn(const std::string& path) {
    try {
        store->keepStateIn(openState(path, loginName()));
        return true;
    } catch (const std::exception& error) {
        output.message(error.what());
        return false;
    }
}

void Session::assign(const std::vector<Assignment>& assignments) {
    if (assignments.empty()) return;
    configuration::ValueMap values;
    for (const auto& [key, text] : assignments) values[key] = configuration::typedText(text);
    store->addInMemorySource("command-line", "", SourceRequest::commandLineOrder, true,
                             std::move(values));
}

void Session::remarkOn(const std::vector<Assignment>& assignments) {
    std::map<std::string, std::string> texts;
    for (const auto& [key, text] : assignments) texts[key] = text;
    const auto secrets = settings::secretKeys(store);
    for (const auto& [key, text] : texts) {
        const auto stored = configuration::typedText(text);
        if (isMeantBy(text, stored)) continue;
        output.message("--set " + abbreviated(key, mostRepeatedBytes) + ": " +
                       otherwiseStored(text, stored, secrets.count(key) != 0));
    }
}

bool Session::load(const std::vector<SourceRequest>& requests, bool watchesFiles) {
    sources->watchFiles(watchesFiles);
    const auto failures = sources->begin(requests);
    for (const auto& failure : failures) output.message(failure);
    return failures.empty();
}

void Session::declareSettings(const DeclareSettings& declare) {
    if (declare) declared = declare(store);
    if (!settings::describe(store).empty()) settingsCommand.emplace(store, registry);
}

std::shared_ptr<const void> Session::serve(const http::ServerOptions& options) {
    return host::serve(store, options, [this](const auto& line) { output.answer(line); });
}

std::string Session::describe(const std::string& form) const {
    return manual(form, programUsage(), registry->commands());
}

void Session::refuseCommandsAmong(const std::vector<SourceRequest>& requests) const {
    refuseMisplacedCommands(requests, registry->names());
}

bool Session::runLines(const std::vector<std::string>& lines) {
    GivenLines given(lines);
    return console.run(given);
}

bool Session::converse(bool keepsHistory) {
    if (commandsAreTyped()) {
        const auto typed = lineEditor(keepsHistory);
        console.run(*typed);
        return true;
    }
    LineReader read(std::cin);
    return console.run(read);
}

Watches::Show Session::showValue(decltype(&optionText) line) const {
    return [line, announcements = announcements, watched = std::weak_ptr(store)](
               const auto& key, const auto& value) {
        const auto open = watched.lock();
        const bool isSecret = open != nullptr && settings::isSecret(open, key);
        announcements->announce(line(key, value, isSecret));
    };
}

std::unique_ptr<LineSource> Session::lineEditor(bool keepsHistory) {
    const Completer completer(
        registry, [words = ArgumentWords(store, watches, sources)](
                      const auto& name, const auto& typed) { return words.of(name, typed); });
    LineEditor::Memory memory;
    if (keepsHistory) memory = history();
    output.answer(greeting);
    return std::make_unique<LineEditor>(
        [completer](const std::string& line) { return completer.complete(line); }, *announcements,
        std::move(memory));
}

// What may hold a secret is not kept.
LineEditor::Memory Session::history() {
    const auto file = usualHistoryFile();
    if (!file) return {};
    try {
        const auto kept = std::make_shared<const LineHistory>(*file);
        return {kept->earlierLines(), [kept, store = store](const std::string& line) {
                    if (!mayHoldSecret(line, settings::secretKeys(store))) kept->add(line);
                }};
    } catch (const std::runtime_error& error) {
        output.message(error.what());
        return {};
    }
}

}  // namespace velkor::host
