#pragma once

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "fuzz/store/OwnSource.hpp"
#include "fuzz/store/System.hpp"
#include "fuzz/store/Watches.hpp"
#include "tests/support/LogCapture.hpp"

namespace velkor::fuzz::store {

/// A store, with its callers and all that it calls.
class RealSystem final : public System {
public:
    RealSystem();

    bool hasStore() const noexcept override { return store != nullptr; }
    void end() override;

private:
    using Value = configuration::ConfigurationValue;
    template <class T>
    using Publisher = reactive_streams::PublisherAPI<T>;

    std::string carryOut(const Step& step) override;
    std::string read(const Step& step);
    std::string readAtOnce(const Step& step);
    std::string write(const Step& step);
    std::string changeSources(const Step& step);
    void startCapture(const Step& step);

    std::vector<std::shared_ptr<OwnSource>> own{};
    std::uint64_t lastVersion = 0;
    Watches<Publisher<Value>, configuration::ConfigurationValue> watches{*this, ofValues};
    Watches<Publisher<configuration::OptionChange>, configuration::OptionChange> changeWatches{
        *this, ofChanges};
    std::shared_ptr<configuration::ConfigurationImpl> store;
    std::optional<velkor::testing::LogCapture> capture{};
};

}  // namespace velkor::fuzz::store
