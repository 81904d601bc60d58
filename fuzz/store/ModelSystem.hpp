#pragma once

#include <memory>
#include <string>
#include <vector>

#include "fuzz/store/ModelStore.hpp"
#include "fuzz/store/System.hpp"
#include "fuzz/store/Watches.hpp"

namespace velkor::fuzz::store {

/// The model of a store, with its callers and all that it calls.
class ModelSystem final : public System {
public:
    ModelSystem();

    bool hasStore() const noexcept override { return store != nullptr; }
    void end() override;

private:
    std::string carryOut(const Step& step) override;
    std::string onStore(const Step& step);

    std::vector<std::shared_ptr<ModelSource>> own{};
    Watches<ModelPublisher, configuration::ConfigurationValue> watches{*this, ofValues};
    Watches<ModelChanges, configuration::OptionChange> changeWatches{*this, ofChanges};
    std::shared_ptr<ModelStore> store;
};

}  // namespace velkor::fuzz::store
