#pragma once

#include <array>
#include <functional>
#include <memory>
#include <string>

#include "configuration/ConfigurationImpl.hpp"
#include "fuzz/settings/System.hpp"
#include "settings/ChangeHandle.hpp"
#include "settings/testing/Override.hpp"

namespace velkor::fuzz::settings {

/// A setting of any type.
class AnySetting {
public:
    using Callback = std::function<void(const std::string& before, const std::string& now)>;

    virtual ~AnySetting() = default;

    /// Value and status.
    virtual std::string spelled() const = 0;

    virtual velkor::settings::ChangeHandle onChange(Callback callback) = 0;
};

/// The system itself.
class RealSettings final : public System {
public:
    RealSettings();

    void end() override;

private:
    std::string carryOut(const Step& step) override;
    std::string answer(const Step& step);
    std::string change(configuration::ConfigurationImpl& open, const Step& step);
    std::string watch(const Step& step);
    void beginOverride(const Step& step);

    std::shared_ptr<configuration::ConfigurationImpl> store;
    std::array<std::unique_ptr<velkor::settings::testing::Override>, overrides> overriding;
    std::array<std::shared_ptr<AnySetting>, slots> settings;
    std::array<std::array<velkor::settings::ChangeHandle, 2>, slots> handles;
};

}  // namespace velkor::fuzz::settings
