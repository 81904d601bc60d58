// Sources with one mistake each, which the contract finds. They are no tests of this program's own:
// check_refused.sh runs them and expects exactly the failure that belongs to the mistake.

#include <chrono>
#include <memory>
#include <optional>
#include <set>
#include <string>
#include <utility>

#include "configuration/sources/AttachedSource.hpp"
#include "layers/testing/SourceContract.hpp"
#include "tests/layers/contract/RightSource.hpp"

namespace velkor::layers {
namespace {

using configuration::ChangeListener;
using configuration::ConfigurationSource;
using configuration::ConfigurationValue;
using configuration::ValueMap;
using namespace layers::testing;

// Wrong sources let the contract wait, so it is told not to wait long.
constexpr std::chrono::seconds shortPatience{3};

template <class Source>
class Wrong : public SourceSubject {
public:
    std::shared_ptr<ConfigurationSource> make(const ValueMap& values) override {
        return std::make_shared<Source>(values);
    }
    std::chrono::milliseconds patience() const override { return shortPatience; }
};

template <class Source>
class WrongWhenItChanges : public ChangingSubject {
public:
    std::shared_ptr<ConfigurationSource> make(const ValueMap& values) override {
        source = std::make_shared<Source>(values);
        return source;
    }
    void change(const std::string& key, const std::optional<ConfigurationValue>& value) override {
        if (value) {
            source->set(key, *value);
        } else {
            source->unset(key);
        }
    }
    std::chrono::milliseconds patience() const override { return shortPatience; }

private:
    std::shared_ptr<Source> source;
};

// Its table of keys was made once.
class HidesNewKeys : public RightSource {
public:
    explicit HidesNewKeys(const ValueMap& initial)
        : RightSource(initial), known(RightSource::keys()) {}

    std::set<std::string> keys() override {
        std::set<std::string> shown;
        for (const auto& key : RightSource::keys()) {
            if (known.count(key) > 0) shown.insert(key);
        }
        return shown;
    }

private:
    const std::set<std::string> known;
};
INSTANTIATE_TYPED_TEST_SUITE_P(HidesNewKeys, SourceContract, Wrong<HidesNewKeys>);

class KeepsIntegersAsTexts : public RightSource {
public:
    using RightSource::RightSource;
    ConfigurationValue set(const std::string& key, ConfigurationValue value) override {
        if (const auto* const integer = boost::get<int>(&value)) value = std::to_string(*integer);
        return RightSource::set(key, value);
    }
};
INSTANTIATE_TYPED_TEST_SUITE_P(KeepsIntegersAsTexts, SourceContract, Wrong<KeepsIntegersAsTexts>);

class GivesTheNewValue : public RightSource {
public:
    using RightSource::RightSource;
    ConfigurationValue set(const std::string& key, ConfigurationValue value) override {
        RightSource::set(key, value);
        return value;
    }
};
INSTANTIATE_TYPED_TEST_SUITE_P(GivesTheNewValue, SourceContract, Wrong<GivesTheNewValue>);

class GivesNoValueForNewKeys : public RightSource {
public:
    using RightSource::RightSource;
    ConfigurationValue set(const std::string& key, ConfigurationValue value) override {
        const bool isNew = !has(key);
        const auto answer = RightSource::set(key, std::move(value));
        return isNew ? ConfigurationValue() : answer;
    }
};
INSTANTIATE_TYPED_TEST_SUITE_P(GivesNoValueForNewKeys, SourceContract,
                               Wrong<GivesNoValueForNewKeys>);

class IgnoresWrites : public RightSource {
public:
    using RightSource::RightSource;
    ConfigurationValue set(const std::string&, ConfigurationValue value) override { return value; }
};
class NotWritable : public Wrong<IgnoresWrites> {
public:
    bool isWritable() const override { return false; }
};
INSTANTIATE_TYPED_TEST_SUITE_P(IgnoresWrites, SourceContract, NotWritable);

class ForgetsSilently : public RightSource {
public:
    using RightSource::RightSource;
    std::optional<ConfigurationValue> unset(const std::string& key) override { return take(key); }
};
INSTANTIATE_TYPED_TEST_SUITE_P(ForgetsSilently, SourceContract, Wrong<ForgetsSilently>);

class TellsOfMissingKeys : public RightSource {
public:
    using RightSource::RightSource;
    std::optional<ConfigurationValue> unset(const std::string& key) override {
        auto former = take(key);
        tell(key);
        return former;
    }
};
INSTANTIATE_TYPED_TEST_SUITE_P(TellsOfMissingKeys, SourceContract, Wrong<TellsOfMissingKeys>);

class TellsTwice : public RightSource {
public:
    using RightSource::RightSource;
    ConfigurationValue set(const std::string& key, ConfigurationValue value) override {
        auto answer = RightSource::set(key, std::move(value));
        tell(key);
        return answer;
    }
};
INSTANTIATE_TYPED_TEST_SUITE_P(TellsTwice, SourceContract, Wrong<TellsTwice>);

class TellsOfNewKeysTooEarly : public RightSource {
public:
    using RightSource::RightSource;
    ConfigurationValue set(const std::string& key, ConfigurationValue value) override {
        if (has(key)) return RightSource::set(key, std::move(value));
        tell(key);
        const Lock lock(mutex);
        values[key] = value;
        return value;
    }
};
INSTANTIATE_TYPED_TEST_SUITE_P(TellsOfNewKeysTooEarly, SourceContract,
                               Wrong<TellsOfNewKeysTooEarly>);

class TellsUnderItsLock : public RightSource {
public:
    using RightSource::RightSource;
    ConfigurationValue set(const std::string& key, ConfigurationValue value) override {
        const Lock lock(mutex);
        return RightSource::set(key, std::move(value));
    }
};
INSTANTIATE_TYPED_TEST_SUITE_P(TellsUnderItsLock, SourceContract, Wrong<TellsUnderItsLock>);

class KeepsItsFirstListener : public RightSource {
public:
    using RightSource::RightSource;
    void setChangeListener(ChangeListener newListener) override {
        const Lock lock(mutex);
        if (newListener && *listener) return;
        RightSource::setChangeListener(std::move(newListener));
    }
};
INSTANTIATE_TYPED_TEST_SUITE_P(KeepsItsFirstListener, SourceContract, Wrong<KeepsItsFirstListener>);

class KeepsAListenerTakenBack : public RightSource {
public:
    using RightSource::RightSource;
    void setChangeListener(ChangeListener newListener) override {
        if (newListener) RightSource::setChangeListener(std::move(newListener));
    }
};
INSTANTIATE_TYPED_TEST_SUITE_P(KeepsAListenerTakenBack, SourceContract,
                               Wrong<KeepsAListenerTakenBack>);

class WaitsForNoCall : public RightSource {
public:
    using RightSource::RightSource;
    bool mayReturn() const override { return true; }
};
INSTANTIATE_TYPED_TEST_SUITE_P(WaitsForNoCall, SourceContract, WrongWhenItChanges<WaitsForNoCall>);

class WaitsForItself : public RightSource {
public:
    using RightSource::RightSource;
    bool mayReturn() const override { return callers.empty(); }
};
INSTANTIATE_TYPED_TEST_SUITE_P(WaitsForItself, SourceContract, WrongWhenItChanges<WaitsForItself>);

// It means to spare its listener what it takes for the same news.
class TellsOfOtherKeysOnly : public RightSource {
public:
    using RightSource::RightSource;
    void tell(const std::string& key) override {
        if (std::exchange(lastTold, key) != key) RightSource::tell(key);
    }

private:
    std::string lastTold;
};
INSTANTIATE_TYPED_TEST_SUITE_P(TellsOfOtherKeysOnly, SourceContract, Wrong<TellsOfOtherKeysOnly>);

class CanBeAddedOnce : public RightSource, public configuration::AttachedSource {
public:
    using RightSource::RightSource;
    void attach(std::weak_ptr<configuration::SourceHost>) override {
        if (std::exchange(wasAttached, true)) throw std::invalid_argument("It was added before.");
    }
    void detach() noexcept override {}

private:
    bool wasAttached = false;
};
INSTANTIATE_TYPED_TEST_SUITE_P(CanBeAddedOnce, SourceContract, Wrong<CanBeAddedOnce>);

class OwnsItsStore : public RightSource, public configuration::AttachedSource {
public:
    using RightSource::RightSource;
    void attach(std::weak_ptr<configuration::SourceHost> newHost) override {
        host = newHost.lock();
    }
    void detach() noexcept override { host.reset(); }

private:
    std::shared_ptr<configuration::SourceHost> host;
};
class OwningItsStore : public SourceSubject {
public:
    ~OwningItsStore() override {
        if (source != nullptr) source->detach();  // store and source leave no cycle behind
    }
    std::shared_ptr<ConfigurationSource> make(const ValueMap& values) override {
        source = std::make_shared<OwnsItsStore>(values);
        return source;
    }
    std::chrono::milliseconds patience() const override { return shortPatience; }

private:
    std::shared_ptr<OwnsItsStore> source;
};
INSTANTIATE_TYPED_TEST_SUITE_P(OwnsItsStore, SourceContract, OwningItsStore);

}  // namespace
}  // namespace velkor::layers
