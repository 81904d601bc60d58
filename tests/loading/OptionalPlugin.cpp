// A plugin that uses each of the libraries that not every build has.

#include <chrono>
#include <exception>
#include <filesystem>
#include <memory>
#include <stdexcept>
#include <string>
#include <variant>

#include "configuration/ConfigurationImpl.hpp"
#include "http/Server.hpp"
#include "http/ServerOptions.hpp"
#include "layers/environment/EnvironmentSource.hpp"
#include "layers/etcd/EtcdSource.hpp"
#include "layers/files/ReloadingFileSource.hpp"
#include "layers/sqlite/SqliteSource.hpp"
#include "messages/MessageService.hpp"
#include "settings/Setting.hpp"
#include "tests/loading/LoadingPlugin.hpp"

namespace {

using velkor::configuration::ConfigurationImpl;
using velkor::configuration::ConfigurationValue;

void require(bool condition, const char* claim) {
    if (!condition) throw std::logic_error(claim);
}

ConfigurationValue text(const std::string& value) {
    return value;
}

void useSettings(const std::shared_ptr<ConfigurationImpl>& store) {
    int told = 0;
    velkor::settings::Setting<int> port(store, "port", 80, velkor::settings::between(1, 65535));
    const auto handle = port.onChange([&told](int, int now) { told = now; });
    store->set("port", 90).get();
    require(port.get() == 90 && told == 90, "a setting follows its key");
}

void useMessages(const std::shared_ptr<ConfigurationImpl>& store) {
    const velkor::messages::MessageService service(store);
    const auto dispatcher = service.dispatcherFor(velkor::messages::allRequestTypes());
    const auto answer = dispatcher->dispatch({"velkor/configuration/ConfigurationKeys", "{}"});
    require(std::holds_alternative<velkor::messages::JsonMessage>(answer), "messages are answered");
}

void useLayers(ConfigurationImpl& store, const std::filesystem::path& file) {
    const char* const variables[] = {"APP_COLOR=red", nullptr};
    store
        .addSource("environment", "", 3, true,
                   std::make_shared<velkor::layers::EnvironmentSource>(
                       velkor::layers::EnvironmentNames("APP_"), variables))
        .get();
    require(store.get("color").get() == text("red"), "the environment answers");
    store
        .addSource("file", "", 4, true, std::make_shared<velkor::layers::ReloadingFileSource>(file))
        .get();
    require(store.get("file.key").get() == text("file value"), "a file answers");
}

void useDatabase(ConfigurationImpl& store, const std::filesystem::path& folder) {
    const auto state = velkor::layers::SqliteSource::open(folder / "state.db");
    store.addSource("state", "", -1, false, state).get();
    store.set("lasting", 7).get();
    require(state->committed().get(), "a write lasts");
}

// Nobody listens on the first port.
void useEtcd(ConfigurationImpl& store) {
    velkor::layers::EtcdOptions options;
    options.startWithin = std::chrono::milliseconds(1);
    options.withoutServer = velkor::layers::StartWithoutServer::empty;
    store
        .addSource("etcd", "", 5, false,
                   velkor::layers::EtcdSource::open({"http://127.0.0.1:1"}, "prefix/", options))
        .get();
}

void useServer(const std::shared_ptr<ConfigurationImpl>& store) {
    velkor::http::Server server(store, {});
    require(server.port() != 0, "a server listens");
    server.stop();
}

}  // namespace

void velkorUseConfiguration(const char* propertyFile, std::string& complaint) {
    try {
        const std::filesystem::path file = propertyFile;
        const auto store = std::make_shared<ConfigurationImpl>();
        useSettings(store);
        useMessages(store);
        useLayers(*store, file);
        useDatabase(*store, file.parent_path());
        useEtcd(*store);
        useServer(store);
    } catch (const std::exception& error) {
        complaint = error.what();
    }
}
