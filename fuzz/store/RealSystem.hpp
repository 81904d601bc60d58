#pragma once

#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "fuzz/store/OwnSource.hpp"
#include "fuzz/store/System.hpp"
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
    using Publisher = reactive_streams::PublisherAPI<Value>;

    struct Watch {
        std::shared_ptr<Publisher> held;
        std::weak_ptr<reactive_streams::Subscription> subscription;
    };

    std::string carryOut(const Step& step) override;
    std::string read(const Step& step);
    std::string write(const Step& step);
    std::string changeSources(const Step& step);
    std::string watch(const Step& step);
    void subscribe(Publisher& publisher, std::size_t number, const Step& step);
    std::string onWatch(const Step& step);
    void startCapture(const Step& step);

    std::vector<std::shared_ptr<OwnSource>> own{};
    std::vector<Watch> watches{};
    std::shared_ptr<configuration::ConfigurationImpl> store;
    std::optional<velkor::testing::LogCapture> capture{};
};

}  // namespace velkor::fuzz::store
