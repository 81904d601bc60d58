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
VELKOR_SOURCE_CONTRACT(HidesNewKeys, Wrong<HidesNewKeys>);

class KeepsIntegersAsTexts : public RightSource {
public:
    using RightSource::RightSource;
    ConfigurationValue set(const std::string& key, ConfigurationValue value) override {
        if (const auto* const integer = boost::get<int>(&value)) value = std::to_string(*integer);
        return RightSource::set(key, value);
    }
};
VELKOR_SOURCE_CONTRACT(KeepsIntegersAsTexts, Wrong<KeepsIntegersAsTexts>);

class GivesTheNewValue : public RightSource {
public:
    using RightSource::RightSource;
    ConfigurationValue set(const std::string& key, ConfigurationValue value) override {
        RightSource::set(key, value);
        return value;
    }
};
VELKOR_SOURCE_CONTRACT(GivesTheNewValue, Wrong<GivesTheNewValue>);

class GivesNoValueForNewKeys : public RightSource {
public:
    using RightSource::RightSource;
    ConfigurationValue set(const std::string& key, ConfigurationValue value) override {
        const bool isNew = !has(key);
        const auto answer = RightSource::set(key, std::move(value));
        return isNew ? ConfigurationValue() : answer;
    }
};
VELKOR_SOURCE_CONTRACT(GivesNoValueForNewKeys, Wrong<GivesNoValueForNewKeys>);

class IgnoresWrites : public RightSource {
public:
    using RightSource::RightSource;
    ConfigurationValue set(const std::string&, ConfigurationValue value) override { return value; }
};
class NotWritable : public Wrong<IgnoresWrites> {
public:
    bool isWritable() const override { return false; }
};
VELKOR_SOURCE_CONTRACT(IgnoresWrites, NotWritable);

class ForgetsSilently : public RightSource {
public:
    using RightSource::RightSource;
    std::optional<ConfigurationValue> unset(const std::string& key) override { return take(key); }
};
VELKOR_SOURCE_CONTRACT(ForgetsSilently, Wrong<ForgetsSilently>);

class TellsOfMissingKeys : public RightSource {
public:
    using RightSource::RightSource;
    std::optional<ConfigurationValue> unset(const std::string& key) override {
        auto former = take(key);
        tell(key);
        return former;
    }
};
VELKOR_SOURCE_CONTRACT(TellsOfMissingKeys, Wrong<TellsOfMissingKeys>);

class TellsTwice : public RightSource {
public:
    using RightSource::RightSource;
    ConfigurationValue set(const std::string& key, ConfigurationValue value) override {
        auto answer = RightSource::set(key, std::move(value));
        tell(key);
        return answer;
    }
};
VELKOR_SOURCE_CONTRACT(TellsTwice, Wrong<TellsTwice>);

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
VELKOR_SOURCE_CONTRACT(TellsOfNewKeysTooEarly, Wrong<TellsOfNewKeysTooEarly>);

class TellsUnderItsLock : public RightSource {
public:
    using RightSource::RightSource;
    ConfigurationValue set(const std::string& key, ConfigurationValue value) override {
        const Lock lock(mutex);
        return RightSource::set(key, std::move(value));
    }
};
VELKOR_SOURCE_CONTRACT(TellsUnderItsLock, Wrong<TellsUnderItsLock>);

class KeepsItsFirstListener : public RightSource {
public:
    using RightSource::RightSource;
    void setChangeListener(ChangeListener newListener) override {
        const Lock lock(mutex);
        if (newListener && *listener) return;
        RightSource::setChangeListener(std::move(newListener));
    }
};
VELKOR_SOURCE_CONTRACT(KeepsItsFirstListener, Wrong<KeepsItsFirstListener>);

class KeepsAListenerTakenBack : public RightSource {
public:
    using RightSource::RightSource;
    void setChangeListener(ChangeListener newListener) override {
        if (newListener) RightSource::setChangeListener(std::move(newListener));
    }
};
VELKOR_SOURCE_CONTRACT(KeepsAListenerTakenBack, Wrong<KeepsAListenerTakenBack>);

class WaitsForNoCall : public RightSource {
public:
    using RightSource::RightSource;
    bool mayReturn() const override { return true; }
};
VELKOR_SOURCE_CONTRACT(WaitsForNoCall, WrongWhenItChanges<WaitsForNoCall>);

class WaitsForItself : public RightSource {
public:
    using RightSource::RightSource;
    bool mayReturn() const override { return callers.empty(); }
};
VELKOR_SOURCE_CONTRACT(WaitsForItself, WrongWhenItChanges<WaitsForItself>);

// It means to spare its listener what it takes for the same news.
class TellsOfOtherKeysOnly : public RightSource {
public:
    using RightSource::RightSource;
    void setChangeListener(ChangeListener newListener) override {
        lastTold.clear();
        RightSource::setChangeListener(std::move(newListener));
    }
    void tell(const std::string& key) override {
        if (std::exchange(lastTold, key) != key) RightSource::tell(key);
    }

private:
    std::string lastTold;
};
VELKOR_SOURCE_CONTRACT(TellsOfOtherKeysOnly, Wrong<TellsOfOtherKeysOnly>);

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
VELKOR_SOURCE_CONTRACT(CanBeAddedOnce, Wrong<CanBeAddedOnce>);

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
VELKOR_SOURCE_CONTRACT(OwnsItsStore, OwningItsStore);

}  // namespace
}  // namespace velkor::layers
