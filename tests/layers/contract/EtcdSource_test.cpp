#include "layers/etcd/EtcdSource.hpp"

#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "layers/testing/SourceContract.hpp"
#include "tests/layers/etcd/server/EtcdMember.hpp"

namespace velkor::layers {
namespace {

using configuration::ConfigurationSource;
using configuration::ConfigurationValue;
using configuration::ValueMap;
using namespace layers::testing;

/// One server for all rules, each of which has keys of its own. It ends with the thread that starts
/// it, and rules run on threads of theirs.
class Server : public ::testing::Environment {
public:
    void SetUp() override { cluster = std::make_unique<velkor::testing::EtcdCluster>(); }
    void TearDown() override { cluster.reset(); }

    std::vector<std::string> urls() const { return cluster->urls(); }

private:
    std::unique_ptr<velkor::testing::EtcdCluster> cluster;
};

Server& server() {
    static auto* const environment =
        static_cast<Server*>(::testing::AddGlobalTestEnvironment(new Server));
    return *environment;
}

[[maybe_unused]] const Server& registered = server();

// What changes by itself is what another process writes.
class Etcd : public ChangingSubject {
public:
    std::shared_ptr<ConfigurationSource> make(const ValueMap& values) override {
        static int number = 0;
        const std::string prefix = std::to_string(++number) + "/";
        other = EtcdSource::open(server().urls(), prefix);
        for (const auto& [key, value] : values) other->set(key, value);
        other->committed().get();
        auto source = EtcdSource::open(server().urls(), prefix);
        onTrial = source;
        return source;
    }

    // What the source on trial wrote before is not to come after it.
    void change(const std::string& key, const std::optional<ConfigurationValue>& value) override {
        if (const auto source = onTrial.lock()) source->committed().get();
        if (value) {
            other->set(key, *value);
        } else {
            other->unset(key);
        }
    }

private:
    std::shared_ptr<EtcdSource> other;
    std::weak_ptr<EtcdSource> onTrial;
};

VELKOR_SOURCE_CONTRACT(EtcdSource, Etcd);

}  // namespace
}  // namespace velkor::layers
