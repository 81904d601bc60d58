#include "fuzz/store/RealSystem.hpp"

#include <algorithm>
#include <utility>

#include "configuration/sources/PropertyFileSource.hpp"
#include "fuzz/Finding.hpp"
#include "fuzz/Values.hpp"

namespace velkor::fuzz::store {

namespace {

/// What a call is answered with. A future that fails is told from a call that throws.
template <class Call, class Spell>
std::string answerOf(Call call, Spell spell) {
    auto future = call();
    try {
        return spell(future.get());
    } catch (const std::exception& error) {
        return std::string("fails ") + error.what();
    }
}

std::string spelledHolders(const std::vector<configuration::Option>& holders) {
    std::string all;
    for (const auto& option : holders) all += spelledOption(option) + "; ";
    return all;
}

std::string spelledOptions(const std::vector<std::optional<configuration::Option>>& options) {
    std::string all;
    for (const auto& option : options) {
        all += (option ? spelledOption(*option) : "nothing") + "; ";
    }
    return all;
}

std::string spelledSources(const std::vector<configuration::SourceDescription>& sources) {
    std::string all;
    for (const auto& source : sources) {
        all += source.name + '|' + source.group + '|' + std::to_string(source.order) + '|' +
               spelledBool(source.readOnly) + ' ';
    }
    return all;
}

std::string spelledOutcome(const std::vector<configuration::AppliedChange>& changes) {
    std::string all;
    for (const auto& change : changes) {
        all += change.key + " in " + change.source + " was " +
               (change.before ? exactly(*change.before) : "nothing") + "; ";
    }
    return all;
}

std::string fileOf(const configuration::ValueMap& values) {
    std::string text;
    for (const auto& [key, value] : values) {
        text += key + '=' + boost::get<std::string>(value) + '\n';
    }
    return text;
}

// A page has two keys at most, and one unless there are no more.
std::vector<std::string> pagesFrom(configuration::ConfigurationImpl& store, std::string first) {
    constexpr std::size_t most = 2;
    std::vector<std::string> all;
    for (;;) {
        const auto page = store.keysFrom(first, most).get();
        if (page.empty()) return all;
        if (page.size() > most) all.emplace_back("a page that is too large");
        all.insert(all.end(), page.begin(), page.end());
        first = all.back() + '\0';
    }
}

// The class of the source, which ends the record, is not the model's.
std::string recordOf(const std::string& message) {
    const bool isAdding = message.rfind("addSource: ", 0) == 0;
    return isAdding ? message.substr(0, message.rfind(", ")) : message;
}

}  // namespace

RealSystem::RealSystem() : store(std::make_shared<configuration::ConfigurationImpl>()) {
    for (std::size_t i = 0; i < ownSources; ++i) {
        own.push_back(std::make_shared<OwnSource>(*this, i));
    }
}

void RealSystem::end() {
    store.reset();
    watches.end();
    changeWatches.end();
}

std::string RealSystem::carryOut(const Step& step) {
    if (watches.isMeant(step)) return watches.carryOut(step);
    if (changeWatches.isMeant(step)) return changeWatches.carryOut(step);
    switch (step.operation) {
        case 't':
            own[step.number]->temper = {step.mood, step.reaction};
            return "";
        case 'l':
            startCapture(step);
            return "";
        case 'D':
            store.reset();
            return "";
        default:
            return hasStore() ? read(step) : "no store";
    }
}

std::string RealSystem::read(const Step& step) {
    switch (step.operation) {
        case 'g':
            return answerOf([&] { return store->get(step.key); }, exactly);
        case 'o':
            return answerOf([&] { return store->getOption(step.key); }, spelledOption);
        case 'h':
            return answerOf([&] { return store->has(step.key); }, spelledBool);
        case 'e':
            return answerOf([&] { return store->explain(step.key); }, spelledHolders);
        case 'k':
            return answerOf([&] { return store->keys(); }, spelledTexts<std::set<std::string>>);
        case 'f':
            return spelledTexts(pagesFrom(*store, step.key));
        case 'd':
            return answerOf([&] { return store->describeSources(); }, spelledSources);
        case 'n':
            return readAtOnce(step);
        default:
            return write(step);
    }
}

std::string RealSystem::readAtOnce(const Step& step) {
    const std::uint64_t before = lastVersion;  // what the store calls may change and read it
    return answerOf([&] { return store->read(step.keys); },
                    [&](const configuration::Reading& reading) {
                        expectThat(reading.version >= before, "A version is never lower",
                                   std::to_string(reading.version));
                        lastVersion = std::max(lastVersion, reading.version);
                        return spelledOptions(reading.options);
                    });
}

std::string RealSystem::write(const Step& step) {
    switch (step.operation) {
        case 's':
            return answerOf([&] { return store->set(step.key, step.value); }, exactly);
        case 'S':
            return answerOf([&] { return store->set(step.key, step.value, step.name); }, exactly);
        case 'u':
            return answerOf([&] { return store->unset(step.key); }, spelledBool);
        case 'U':
            return answerOf([&] { return store->unset(step.key, step.name); }, spelledBool);
        case 'a':
            return answerOf([&] { return store->apply(step.changes, step.flag); }, spelledOutcome);
        default:
            return changeSources(step);
    }
}

std::string RealSystem::changeSources(const Step& step) {
    const auto add = [&](std::shared_ptr<configuration::ConfigurationSource> source) {
        return answerOf(
            [&] {
                return store->addSource(step.name, step.group, step.order, step.flag,
                                        std::move(source));
            },
            spelledBool);
    };
    switch (step.operation) {
        case 'm':
            return answerOf(
                [&] {
                    return store->addInMemorySource(step.name, step.group, step.order, step.flag,
                                                    configuration::ValueMap(step.values));
                },
                spelledBool);
        case 'p':
            return add(std::make_shared<configuration::PropertyFileSource>(
                configuration::PropertyText{fileOf(step.values)}));
        case 'c':
            return add(own[step.number]);
        case 'r':
            return answerOf([&] { return store->removeSource(step.name); }, spelledBool);
        case 'i':
            return exactly(own[step.number]->set(step.key, step.value));
        case 'W':
            return changeWatches.begin(step, [&] { return store->watchChanges(step.key); });
        default:
            return watches.begin(step, [&] { return store->watchOption(step.key); });
    }
}

void RealSystem::startCapture(const Step& step) {
    startRecording(step);
    if (capture) return;
    capture.emplace("velkor::configuration", common::debug);
    capture->whenRecorded(
        [this](const velkor::testing::LogRecord& written) { record(recordOf(written.message)); });
}

}  // namespace velkor::fuzz::store
