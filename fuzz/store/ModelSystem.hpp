#pragma once

#include <memory>
#include <string>
#include <vector>

#include "fuzz/store/ModelStore.hpp"
#include "fuzz/store/System.hpp"

namespace velkor::fuzz::store {

/// The model of a store, with its callers and all that it calls.
class ModelSystem final : public System {
public:
    ModelSystem();

    bool hasStore() const noexcept override { return store != nullptr; }
    void end() override;

private:
    struct Watch {
        std::shared_ptr<ModelPublisher> held;
        std::weak_ptr<reactive_streams::Subscription> subscription;
    };

    std::string carryOut(const Step& step) override;
    std::string onStore(const Step& step);
    std::string watch(const Step& step);
    void subscribe(ModelPublisher& publisher, std::size_t number, const Step& step);
    std::string onWatch(const Step& step);

    std::vector<std::shared_ptr<ModelSource>> own{};
    std::vector<Watch> watches{};
    std::shared_ptr<ModelStore> store;
};

}  // namespace velkor::fuzz::store
