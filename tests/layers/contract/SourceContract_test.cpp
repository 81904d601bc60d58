// Every source of this repository keeps to the contract. Those of the optional libraries stand in
// files of their own.

#include "layers/testing/SourceContract.hpp"

#include <future>
#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "configuration/sources/ForgettingSource.hpp"
#include "configuration/sources/InMemorySource.hpp"
#include "configuration/sources/PropertyFileSource.hpp"
#include "layers/LiveSource.hpp"
#include "layers/environment/EnvironmentNames.hpp"
#include "layers/environment/EnvironmentSource.hpp"
#include "tests/layers/contract/PropertyText.hpp"
#include "tests/layers/contract/RightSource.hpp"
#include "tests/support/TemporaryFile.hpp"

namespace velkor::layers {
namespace {

using configuration::ConfigurationSource;
using configuration::ConfigurationValue;
using configuration::ValueMap;
using configuration::ValueTable;
using namespace layers::testing;

class InMemory : public SourceSubject {
public:
    std::shared_ptr<ConfigurationSource> make(const ValueMap& values) override {
        return std::make_shared<configuration::InMemorySource>(ValueMap(values));
    }
};
VELKOR_SOURCE_CONTRACT(InMemorySource, InMemory);

class PropertyFile : public SourceSubject {
public:
    std::shared_ptr<ConfigurationSource> make(const ValueMap& values) override {
        file.rewrite(propertyText(values));
        return std::make_shared<configuration::PropertyFileSource>(file.widePath());
    }
    bool isWritable() const override { return false; }
    bool canHold(const ConfigurationValue& value) const override {
        return boost::get<std::string>(&value) != nullptr;
    }

private:
    velkor::testing::TemporaryFile file{""};
};
VELKOR_SOURCE_CONTRACT(PropertyFileSource, PropertyFile);

class Environment : public SourceSubject {
public:
    std::shared_ptr<ConfigurationSource> make(const ValueMap& values) override {
        const EnvironmentNames names("CONTRACT_");
        std::vector<std::string> variables;
        for (const auto& [key, value] : values) {
            variables.push_back(names.nameOf(key).value() + "=" + boost::get<std::string>(value));
        }
        std::vector<const char*> pointers;
        for (const auto& variable : variables) pointers.push_back(variable.c_str());
        pointers.push_back(nullptr);
        return std::make_shared<EnvironmentSource>(names, pointers.data());
    }
    bool isWritable() const override { return false; }
    bool canHold(const ConfigurationValue& value) const override {
        const auto* const text = boost::get<std::string>(&value);
        return text != nullptr && text->find('\0') == std::string::npos;
    }
};
VELKOR_SOURCE_CONTRACT(EnvironmentSource, Environment);

// The base of sources that change by themselves, and as little as makes a source of it.
class LiveTable final : public LiveSource, public configuration::ForgettingSource {
public:
    explicit LiveTable(ValueMap initial) : LiveSource(typeid(LiveTable), std::move(initial)) {}

    ConfigurationValue set(const std::string& key, ConfigurationValue value) override {
        return put(key, value).value_or(value);
    }

    std::optional<ConfigurationValue> unset(const std::string& key) override {
        return put(key, {});
    }

    // Gives what was there before.
    std::optional<ConfigurationValue> put(const std::string& key,
                                          const std::optional<ConfigurationValue>& value) {
        std::optional<ConfigurationValue> former;
        change([&](ValueTable& table) {
            former = table.take(key);
            if (value) table.insert(key, ConfigurationValue(*value));
            return former || value ? Keys{key} : Keys{};
        });
        return former;
    }
};

class Live : public ChangingSubject {
public:
    std::shared_ptr<ConfigurationSource> make(const ValueMap& values) override {
        source = std::make_shared<LiveTable>(values);
        return source;
    }
    void change(const std::string& key, const std::optional<ConfigurationValue>& value) override {
        source->put(key, value);
    }

protected:
    std::shared_ptr<LiveTable> source;
};
VELKOR_SOURCE_CONTRACT(LiveSource, Live);

// The changes come later, on another thread.
class LiveLater : public Live {
public:
    void change(const std::string& key, const std::optional<ConfigurationValue>& value) override {
        latest = std::async(std::launch::async, [former = latest, changed = source, key, value] {
                     if (former.valid()) former.wait();
                     changed->put(key, value);
                 }).share();
    }

private:
    std::shared_future<void> latest;
};
VELKOR_SOURCE_CONTRACT(LiveSourceOnAnotherThread, LiveLater);

class Right : public ChangingSubject {
public:
    std::shared_ptr<ConfigurationSource> make(const ValueMap& values) override {
        source = std::make_shared<RightSource>(values);
        return source;
    }
    void change(const std::string& key, const std::optional<ConfigurationValue>& value) override {
        if (value) {
            source->set(key, *value);
        } else {
            source->unset(key);
        }
    }

private:
    std::shared_ptr<RightSource> source;
};
VELKOR_SOURCE_CONTRACT(WhatTheWrongSourcesDeriveFrom, Right);

}  // namespace
}  // namespace velkor::layers
