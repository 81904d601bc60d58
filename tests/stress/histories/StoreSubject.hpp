#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>

#include "configuration/ConfigurationImpl.hpp"
#include "tests/stress/histories/StoreModel.hpp"

namespace velkor::testing {

/// The store as histories call it. Broken ones, which must be found out, override parts of it.
/// Thread-safe, but for `end`.
class StoreSubject {
public:
    struct Answer {
        std::string text;
        std::optional<std::uint64_t> version{};
    };

    virtual ~StoreSubject() = default;

    /// Makes `call` and spells what it gives, or what its future throws.
    virtual Answer perform(const StoreCall& call);

    virtual std::shared_ptr<reactive_streams::PublisherAPI<configuration::ConfigurationValue>>
    watchOption(const std::string& key) {
        return store->watchOption(key);
    }

    virtual std::shared_ptr<reactive_streams::PublisherAPI<configuration::OptionChange>>
    watchChanges(const std::string& prefix) {
        return store->watchChanges(prefix);
    }

    /// Destroys the store.
    void end() { store.reset(); }

    static std::string textOf(const configuration::ConfigurationValue& value);
    static std::string textOf(const configuration::Option& option);

private:
    Answer answer(const StoreCall& call);
    std::string add(const ModelLayer& layer);

    std::shared_ptr<configuration::ConfigurationImpl> store =
        std::make_shared<configuration::ConfigurationImpl>();
};

/// Lets the threads that wait for a processor have this one's. By a short sleep: on a machine where
/// other processes wait as well, those would get what a thread gives up by a yield.
void letOthersIn();

/// Lets others in now and then, so that threads meet in more places than the machine would choose
/// by itself.
void stumble();

}  // namespace velkor::testing
