#include "tests/stress/histories/StoreSubject.hpp"

#include <chrono>
#include <exception>
#include <random>
#include <set>
#include <thread>
#include <utility>
#include <vector>

#include "configuration/sources/InMemorySource.hpp"

namespace velkor::testing {

namespace {

using configuration::ConfigurationValue;
using Kind = StoreCall::Kind;

/// A source of somebody else, who takes his time.
class StumblingSource final : public configuration::InMemorySource {
public:
    using InMemorySource::InMemorySource;

    ConfigurationValue get(const std::string& key) override {
        stumble();
        return InMemorySource::get(key);
    }
    ConfigurationValue set(const std::string& key, ConfigurationValue value) override {
        stumble();
        return InMemorySource::set(key, std::move(value));
    }
    bool has(const std::string& key) override {
        stumble();
        return InMemorySource::has(key);
    }
    std::set<std::string> keys() override {
        stumble();
        return InMemorySource::keys();
    }
    std::optional<ConfigurationValue> unset(const std::string& key) override {
        stumble();
        return InMemorySource::unset(key);
    }
};

const char* truth(bool value) {
    return value ? "true" : "false";
}

template <class List, class Text>
std::string joined(const List& list, Text textOf) {
    std::string text;
    for (const auto& item : list) text += (text.empty() ? "" : ",") + textOf(item);
    return text;
}

std::string sameText(const std::string& text) {
    return text;
}

std::string optionText(const configuration::Option& option) {
    return StoreSubject::textOf(option);
}

std::vector<configuration::Change> changesOf(const StoreCall& call) {
    std::vector<configuration::Change> changes;
    for (const auto& change : call.changes) {
        changes.push_back({change.key, std::nullopt, change.source});
        if (change.value) changes.back().value = *change.value;
    }
    return changes;
}

std::string textOf(const configuration::AppliedChange& change) {
    return change.key + "@" + change.source + ":" +
           (change.before ? StoreSubject::textOf(*change.before) : "-");
}

std::string textOf(const configuration::SourceDescription& source) {
    return source.name + "(" + source.group + "," + std::to_string(source.order) +
           (source.readOnly ? ",ro" : "") + "){}";
}

}  // namespace

void letOthersIn() {
    std::this_thread::sleep_for(std::chrono::microseconds(1));
}

void stumble() {
    thread_local std::minstd_rand random;
    if (random() % 8 == 0) letOthersIn();
}

std::string StoreSubject::textOf(const ConfigurationValue& value) {
    return std::to_string(boost::get<int>(value));
}

std::string StoreSubject::textOf(const configuration::Option& option) {
    return textOf(option.value) + "@" + option.source;
}

StoreSubject::Answer StoreSubject::perform(const StoreCall& call) {
    try {
        return answer(call);
    } catch (const std::exception& error) {
        return {error.what()};
    }
}

StoreSubject::Answer StoreSubject::answer(const StoreCall& call) {
    switch (call.kind) {
        case Kind::get:
            return {textOf(store->get(call.key).get())};
        case Kind::has:
            return {truth(store->has(call.key).get())};
        case Kind::getOption:
            return {textOf(store->getOption(call.key).get())};
        case Kind::keys:
            return {joined(store->keys().get(), sameText)};
        case Kind::keysFrom:
            return {joined(store->keysFrom(call.key, 1).get(), sameText)};
        case Kind::explain:
            return {joined(store->explain(call.key).get(), optionText)};
        case Kind::read: {
            const auto reading = store->read(call.keys).get();
            const auto text = [](const auto& option) { return option ? textOf(*option) : "-"; };
            return {joined(reading.options, text), reading.version};
        }
        case Kind::describe:
            return {joined(store->describeSources().get(),
                           [](const auto& source) { return testing::textOf(source); })};
        case Kind::dryRun:
        case Kind::apply:
            return {joined(store->apply(changesOf(call), call.kind == Kind::dryRun).get(),
                           [](const auto& change) { return testing::textOf(change); })};
        case Kind::set:
            return {textOf(call.source ? store->set(call.key, call.value, *call.source).get()
                                       : store->set(call.key, call.value).get())};
        case Kind::unset:
            return {truth(call.source ? store->unset(call.key, *call.source).get()
                                      : store->unset(call.key).get())};
        case Kind::add:
            return {add(call.layer)};
        case Kind::remove:
            return {truth(store->removeSource(call.source.value()).get())};
    }
    return {"no such call"};
}

// Half of them the library's own, half of them somebody else's.
std::string StoreSubject::add(const ModelLayer& layer) {
    configuration::ValueMap values(layer.values.begin(), layer.values.end());
    if (layer.order % 2 == 0) {
        return truth(store
                         ->addInMemorySource(layer.name, layer.group, layer.order, layer.readOnly,
                                             std::move(values))
                         .get());
    }
    return truth(store
                     ->addSource(layer.name, layer.group, layer.order, layer.readOnly,
                                 std::make_shared<StumblingSource>(std::move(values)))
                     .get());
}

}  // namespace velkor::testing
