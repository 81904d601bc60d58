#pragma once

#include <gtest/gtest.h>

#include <algorithm>
#include <chrono>
#include <cstddef>
#include <functional>
#include <memory>
#include <mutex>
#include <optional>
#include <ostream>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include "configuration/ConfigurationValue.hpp"
#include "configuration/sources/AttachedSource.hpp"
#include "configuration/sources/ConfigurationSource.hpp"
#include "layers/testing/SourceSubject.hpp"
#include "layers/testing/detail/Noted.hpp"
#include "layers/testing/detail/SampleValues.hpp"

namespace velkor::layers::testing::detail {

using configuration::ConfigurationSource;
using configuration::ConfigurationValue;
using configuration::ValueMap;

/// Makes a subject of its own for each source.
using MakeSubject = std::function<std::shared_ptr<SourceSubject>()>;

/// How a source gets another value.
enum class Way { written, byItself };

inline std::ostream& operator<<(std::ostream& out, Way way) {
    return out << (way == Way::written ? "written" : "changed by itself");
}

/// What a source may count on when it is told that it is registered.
class TrialHost final : public configuration::SourceHost {
public:
    void changeTogether(const std::function<void()>& change) override {
        const std::lock_guard<std::recursive_mutex> lock(mutex);
        change();
    }

private:
    std::recursive_mutex mutex;
};

/// One source on trial. The threads of a rule share it.
class Trial {
public:
    enum class Registration { standIn, byTheRule };

    /// A source that holds `values`. It is registered with a stand-in for a store, unless the rule
    /// is going to register it with a real one. Throws what the subject throws, and
    /// `std::logic_error` "The subject made no source."
    Trial(std::shared_ptr<SourceSubject> tried, const ValueMap& values,
          Registration registration = Registration::standIn)
        : subject(std::move(tried)),
          changing(dynamic_cast<ChangingSubject*>(subject.get())),
          sourceOnTrial(subject->make(values)) {
        if (sourceOnTrial == nullptr) throw std::logic_error("The subject made no source.");
        if (registration == Registration::byTheRule) return;
        attached = dynamic_cast<configuration::AttachedSource*>(sourceOnTrial.get());
        if (attached != nullptr) attached->attach(host);
    }

    ~Trial() {
        try {
            sourceOnTrial->setChangeListener({});
        } catch (...) {
            // A rule has met this before, and says so.
        }
        if (attached != nullptr) attached->detach();
    }

    Trial(const Trial&) = delete;
    Trial& operator=(const Trial&) = delete;

    const std::shared_ptr<ConfigurationSource>& source() const { return sourceOnTrial; }

    std::chrono::milliseconds patience() const { return subject->patience(); }

    /// How this source gets other values. One that never changes knows no way.
    std::vector<Way> ways() const {
        std::vector<Way> all;
        if (subject->isWritable()) all.push_back(Way::written);
        if (changing != nullptr) all.push_back(Way::byItself);
        return all;
    }

    /// Whether a key can go in this way. Forgetting what was written has rules of its own.
    bool losesKeys(Way way) const { return way == Way::byItself && changing->losesKeys(); }

    /// Gives `key` another value, or none. A source that changes by itself may take its time.
    void begin(Way way, const std::string& key, const std::optional<ConfigurationValue>& value) {
        if (way == Way::byItself) {
            changing->change(key, value);
        } else {
            sourceOnTrial->set(key, value.value());
        }
    }

    /// As above, and waits until a source that changes by itself has told `told` of `key` again.
    /// Fails when it hasn't.
    ::testing::AssertionResult finish(Way way, const std::string& key,
                                      const std::optional<ConfigurationValue>& value,
                                      Noted<std::string>& told) {
        const auto former = static_cast<std::ptrdiff_t>(told.all().size());
        begin(way, key, value);
        if (way == Way::written) return ::testing::AssertionSuccess();
        const auto isToldAgain = [&](const std::vector<std::string>& keys) {
            return std::find(keys.begin() + former, keys.end(), key) != keys.end();
        };
        if (told.becomes(patience(), isToldAgain)) return ::testing::AssertionSuccess();
        return ::testing::AssertionFailure() << "The listener was not told of " << key << ".";
    }

    /// Installs a listener that notes the keys that it is told.
    std::shared_ptr<Noted<std::string>> listen() {
        auto told = std::make_shared<Noted<std::string>>();
        sourceOnTrial->setChangeListener([told](const std::string& key) { told->note(key); });
        return told;
    }

private:
    const std::shared_ptr<TrialHost> host = std::make_shared<TrialHost>();
    const std::shared_ptr<SourceSubject> subject;
    ChangingSubject* const changing;  // the same, or null
    const std::shared_ptr<ConfigurationSource> sourceOnTrial;
    configuration::AttachedSource* attached = nullptr;  // the same, if `host` stands for its store
};

}  // namespace velkor::layers::testing::detail
