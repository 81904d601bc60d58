#pragma once

#include <iostream>
#include <map>
#include <memory>
#include <optional>
#include <set>
#include <streambuf>
#include <string>
#include <utility>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "configuration/sources/AttachedSource.hpp"
#include "configuration/sources/ForgettingSource.hpp"
#include "configuration/sources/GroupingSource.hpp"
#include "configuration/sources/MonitoredSource.hpp"
#include "tests/failing/Foreign.hpp"
#include "tests/support/StandardErrorCapture.hpp"
#include "tests/support/ValueText.hpp"

namespace velkor::testing {

/// A source of every kind that a store knows, each call of which can fail, before it does anything.
/// Taking a listener back can't: the store is allowed to end the process then.
class ForeignSource final : public configuration::ConfigurationSource,
                            public configuration::ForgettingSource,
                            public configuration::GroupingSource,
                            public configuration::MonitoredSource,
                            public configuration::AttachedSource {
public:
    using Value = configuration::ConfigurationValue;

    explicit ForeignSource(std::map<std::string, Value> initial) : values(std::move(initial)) {}

    Value get(const std::string& key) override {
        foreignCall();
        return values.at(key);
    }

    // The old value is the answer, or the new one of a new key: nothing fails after the change.
    Value set(const std::string& key, Value value) override {
        foreignCall();
        const auto held = values.find(key);
        if (held != values.end()) {
            held->second.swap(value);
            tell(key);
            return value;
        }
        Value answer = value;
        values.emplace(key, std::move(value));
        tell(key);
        return answer;
    }

    std::optional<Value> unset(const std::string& key) override {
        foreignCall();
        const auto entry = values.extract(key);
        if (entry.empty()) return std::nullopt;
        tell(key);
        return std::move(entry.mapped());
    }

    bool has(const std::string& key) override {
        foreignCall();
        return values.count(key) > 0;
    }

    void setChangeListener(configuration::ChangeListener newListener) override {
        if (newListener) foreignCall();
        listener.swap(newListener);
    }

    std::set<std::string> keys() override {
        foreignCall();
        std::set<std::string> all;
        for (const auto& entry : values) all.insert(entry.first);
        return all;
    }

    void beginGroup() override {
        foreignCall();
        ++groups;
    }
    void endGroup() noexcept override { --groups; }

    configuration::SourceState state() const override {
        foreignCall();
        return {};
    }

    void attach(std::weak_ptr<configuration::SourceHost> newHost) override {
        foreignCall();
        host = std::move(newHost);
    }
    void detach() noexcept override {
        host.reset();
        listener = nullptr;
    }

    /// Changes a key by itself, as another program would make it.
    void change(const std::string& key, Value value) {
        values[key] = std::move(value);
        tell(key);
    }

    std::map<std::string, Value> values;
    configuration::ChangeListener listener;
    std::weak_ptr<configuration::SourceHost> host;
    int groups = 0;

private:
    void tell(const std::string& key) const {
        if (listener) listener(key);
    }
};

/// A standard error whose every write can fail; counts the lines.
class ForeignStandardError final : public std::streambuf {
public:
    ~ForeignStandardError() override { std::cerr.clear(); }
    int lines = 0;

protected:
    std::streamsize xsputn(const char* text, std::streamsize size) override {
        foreignCall();
        lines += static_cast<int>(std::count(text, text + size, '\n'));
        return size;
    }
    int overflow(int character) override {
        const char byte = static_cast<char>(character);
        xsputn(&byte, 1);
        return character;
    }

private:
    StandardErrorRedirection redirection{*this};
};

/// The value of a watched key, and what its watchers were told.
template <class T>
struct Watched {
    std::shared_ptr<reactive_streams::PublisherAPI<T>> stream;
    std::shared_ptr<ForeignSubscriber<T>> subscriber = std::make_shared<ForeignSubscriber<T>>();

    void open(std::shared_ptr<reactive_streams::PublisherAPI<T>> made) {
        stream = std::move(made);
        stream->subscribe(subscriber);
    }
};

/// A store with a table without a group and a foreign source below "far.", all of whose keys are
/// followed.
class StoreScene {
public:
    using Value = configuration::ConfigurationValue;

    StoreScene() {
        store->set(near, Value(longText("old")));
        store->addSource("foreign", "far.", 10, false, source);
        nearWatch.open(store->watchOption(near));
        farWatch.open(store->watchOption(far));
        changes.open(store->watchChanges(""));
        nearWatch.subscriber->values = farWatch.subscriber->values = 0;
    }

    /// What the store holds, as text; "" for nothing.
    std::string textIn(const std::string& key) const {
        return store->has(key).get() ? textOf(store->get(key).get()) : "";
    }

    /// No lock is held, every source can be written and read, and whoever watched is told again.
    void expectAlive() {
        store->has(near)
            .get();  // lets go of what the operation has left: in the thread that made it
        onAnotherThread([this] { store->has(near).get(); });
        EXPECT_EQ(source->groups, 0);
        expectToldNow(near, nearWatch);
        expectToldNow(far, farWatch);
    }

    /// That `watch` was told of a change of its key, or standard error of what kept it from it.
    void expectTold(const Watched<Value>& watch) const {
        EXPECT_TRUE(watch.subscriber->values > 0 || standardError.lines > 0);
    }

    /// That the watchers of a change that is made now are told of it.
    void expectToldNow(const std::string& key, const Watched<Value>& watch) {
        const int before = watch.subscriber->values;
        const int changesBefore = changes.subscriber->values;
        store->set(key, Value(longText("newest")));
        EXPECT_EQ(textIn(key), textOf(Value(longText("newest"))));
        EXPECT_EQ(watch.subscriber->values, before + 1) << key;
        // A stream of changes has failed where it would have missed one. What a subscriber that has
        // thrown left behind comes with the next change.
        EXPECT_TRUE(changes.subscriber->values > changesBefore || changes.subscriber->errors == 1)
            << key;
    }

    const std::string near = longText("near");
    const std::string far = "far." + longText("key");
    const std::string farKey = longText("key");
    const std::string missing = longText("missing");
    const Value oldValue{longText("old")};
    const Value newValue{longText("new")};

    ForeignStandardError standardError;
    std::shared_ptr<configuration::ConfigurationImpl> store =
        std::make_shared<configuration::ConfigurationImpl>();
    std::shared_ptr<ForeignSource> source = std::make_shared<ForeignSource>(
        std::map<std::string, Value>{{longText("key"), Value(longText("old"))}});
    Watched<Value> nearWatch;
    Watched<Value> farWatch;
    Watched<configuration::OptionChange> changes;
};

}  // namespace velkor::testing
