#pragma once

#include <cstddef>
#include <memory>
#include <random>
#include <string>
#include <vector>

#include "benchmarks/fleet/FleetOptions.hpp"
#include "benchmarks/fleet/Journal.hpp"
#include "configuration/ConfigurationImpl.hpp"
#include "layers/etcd/EtcdSource.hpp"
#include "settings/Setting.hpp"

namespace velkor::benchmarks {

/// Where the values of the fleet are.
inline constexpr const char* fleetPrefix = "fleet/";

/// "setting.7": what the settings are called.
std::string settingName(int key);

/// Values tell which host has written them, are written once, and are never 0, the default.
constexpr int writesOfEach = 10'000'000;
constexpr int writerOf(int value) {
    return value / writesOfEach - 1;
}

/// What runs in one process of the fleet: a store with a layer in etcd, and settings on it. Notes
/// what they show.
class Host {
public:
    Host(int number, const FleetOptions& how, const std::vector<std::string>& endpoints,
         Journal& notes);

    /// Carries out the commands that come over `socket` until one says that it is to end. Writes
    /// meanwhile, if told so.
    void serve(int socket);

private:
    using Setting = settings::Setting<int>;

    void follow(int key);
    bool carryOut(char command, int socket);
    void fill();
    void write();
    void write(int key);
    FleetClock::time_point nextWrite();
    void tellValues(int socket) const;

    const int number;
    const FleetOptions options;
    Journal& journal;
    const std::shared_ptr<layers::EtcdSource> source;
    const std::shared_ptr<configuration::ConfigurationImpl> store =
        std::make_shared<configuration::ConfigurationImpl>();
    std::vector<std::unique_ptr<Setting>> settings;
    std::vector<settings::ChangeHandle> following;
    std::minstd_rand random;
    int written = 0;
    FleetClock::time_point writeDue = FleetClock::time_point::max();
};

}  // namespace velkor::benchmarks
