// Prints how large the public classes are, how they are aligned, and where their public members and
// their further bases lie: what programs that are compiled already rely on.

#include <cstddef>
#include <functional>
#include <initializer_list>
#include <iostream>
#include <memory>
#include <string>
#include <utility>

#include "configuration/Changes.hpp"
#include "configuration/ConfigurationImpl.hpp"
#include "configuration/admin/ConfigurationCommandProvider.hpp"
#include "configuration/service/ConfigurationJsonSerialization.hpp"
#include "configuration/service/ConfigurationMessages.hpp"
#include "configuration/service/ConfigurationServiceProviderImpl.hpp"
#include "configuration/sources/InMemorySource.hpp"
#include "configuration/sources/PropertyFileSource.hpp"
#include "framework/DeferredService.hpp"
#include "framework/administration/Administration.hpp"
#include "framework/common/DiagnosticLogger.hpp"
#include "framework/common/TextConversion.hpp"
#include "framework/common/WidePathInputFileStream.hpp"
#include "framework/reactive_streams/CachedValuePublisher.hpp"
#include "framework/reactive_streams/SubscriptionHandle.hpp"
#include "http/Server.hpp"
#include "http/ServerOptions.hpp"
#include "layers/environment/EnvironmentSource.hpp"
#include "layers/etcd/EtcdOptions.hpp"
#include "layers/files/ReloadingFileSource.hpp"
#include "layers/sqlite/SqliteOptions.hpp"
#include "messages/MessageService.hpp"
#include "settings/Setting.hpp"
#include "settings/SettingError.hpp"

namespace {

using namespace velkor;
using namespace velkor::configuration;

/// A part of an object: its name and its address.
using Part = std::pair<const char*, const void*>;

template <class T>
void print(const char* name) {
    std::cout << name << ": " << sizeof(T) << " bytes, aligned to " << alignof(T) << '\n';
}

template <class T>
void print(const char* name, const T& object, std::initializer_list<Part> parts) {
    print<T>(name);
    const auto* const begin = static_cast<const char*>(static_cast<const void*>(&object));
    for (const auto& [part, address] : parts) {
        std::cout << "    " << part << " at " << static_cast<const char*>(address) - begin << '\n';
    }
}

template <class Base, class T>
Part base(const char* name, const T& object) {
    return {name, static_cast<const Base*>(&object)};
}

void printFramework() {
    print<Future<int>>("Future");
    print<Promise<int>>("Promise");
    print<reactive_streams::Subscription>("Subscription");
    print<reactive_streams::Subscriber<int>>("Subscriber");
    print<reactive_streams::Publisher>("Publisher");
    print<reactive_streams::PublisherAPI<int>>("PublisherAPI");
    print<reactive_streams::CachedValuePublisher<int, std::function<void()>>>(
        "CachedValuePublisher");
    print<reactive_streams::SubscriptionHandle>("SubscriptionHandle");
    print<Message>("Message");
    const Address address{};
    print("Address", address, {{"value", &address.value}});
    print<Context>("Context");
    print<ServiceMessage<ConfigurationServiceProvider>>("ServiceMessage");
    print<Lifecycle>("Lifecycle");
    print<ServiceProvider>("ServiceProvider");
    print<DeferredService>("DeferredService");
    print<json::JsonSerializer>("JsonSerializer");
    print<administration::Administration>("Administration");
    print<administration::CommandProvider>("CommandProvider");
    const administration::CommandDescriptor command{};
    print("CommandDescriptor", command,
          {{"name", &command.name},
           {"description", &command.description},
           {"handler", &command.handler},
           {"minimumArguments", &command.minimumArguments},
           {"maximumArguments", &command.maximumArguments}});
    print<common::TextConversion>("TextConversion");
    print<common::WidePathInputFileStream>("WidePathInputFileStream");
    print<common::Severity>("Severity");
    print<common::DiagnosticLogger>("DiagnosticLogger");
}

void printValues() {
    print<ConfigurationValue>("ConfigurationValue");
    print<ValueMap>("ValueMap");
    const Option option("", "", {});
    print("Option", option,
          {{"key", &option.key}, {"source", &option.source}, {"value", &option.value}});
    const Reading reading{};
    print("Reading", reading, {{"version", &reading.version}, {"options", &reading.options}});
    const Change change{};
    print("Change", change,
          {{"key", &change.key}, {"value", &change.value}, {"source", &change.source}});
    const AppliedChange applied{};
    print("AppliedChange", applied,
          {{"key", &applied.key}, {"source", &applied.source}, {"before", &applied.before}});
    const OptionChange told{};
    print("OptionChange", told,
          {{"key", &told.key}, {"option", &told.option}, {"version", &told.version}});
    print<SourceState>("SourceState");
    const SourceDescription source{};
    print("SourceDescription", source,
          {{"name", &source.name},
           {"group", &source.group},
           {"order", &source.order},
           {"readOnly", &source.readOnly},
           {"state", &source.state}});
}

void printStore() {
    print<Configuration>("Configuration");
    const auto store = std::make_shared<ConfigurationImpl>();
    print("ConfigurationImpl", *store,
          {base<std::enable_shared_from_this<Configuration>>("enable_shared_from_this", *store)});
    print<ConfigurationSource>("ConfigurationSource");
    const auto table = std::make_shared<InMemorySource>(ValueMap());
    print("InMemorySource", *table,
          {base<ForgettingSource>("ForgettingSource", *table),
           base<std::enable_shared_from_this<InMemorySource>>("enable_shared_from_this", *table)});
    print<PropertyFileSource>("PropertyFileSource");
}

void printService() {
    const ConfigurationGet get{};
    print("ConfigurationGet", get, {{"key", &get.key}});
    const ConfigurationSet set{};
    print("ConfigurationSet", set,
          {{"key", &set.key}, {"value", &set.value}, {"source", &set.source}});
    const ConfigurationKeys all{};
    print("ConfigurationKeys", all, {{"filter", &all.filter}});
    const AddPropertyFileSource add{};
    print("AddPropertyFileSource", add,
          {{"name", &add.name},
           {"group", &add.group},
           {"order", &add.order},
           {"readOnly", &add.readOnly},
           {"path", &add.path}});
    const ConfigurationOptionResponse option{};
    print("ConfigurationOptionResponse", option, {{"option", &option.option}});
    const ConfigurationKeysResponse keys{};
    print("ConfigurationKeysResponse", keys, {{"keys", &keys.keys}});
    print<ConfigurationServiceProvider>("ConfigurationServiceProvider");
    print<ConfigurationServiceProviderImpl>("ConfigurationServiceProviderImpl");
    print<ConfigurationJsonSerialization>("ConfigurationJsonSerialization");
    print<ConfigurationCommandProvider>("ConfigurationCommandProvider");
}

// Without the sources that only their own library makes.
void printOptionalLibraries() {
    print<messages::JsonMessage>("JsonMessage");
    print<messages::JsonSerializerImpl>("JsonSerializerImpl");
    print<messages::MessageDispatcher>("MessageDispatcher");
    print<messages::MessageService>("MessageService");
    print<settings::Setting<int>>("Setting of a number");
    print<settings::Setting<std::string>>("Setting of a text");
    print<settings::ChangeHandle>("ChangeHandle");
    print<settings::SettingError>("SettingError");
    print<layers::LiveSource>("LiveSource");
    print<layers::EnvironmentNames>("EnvironmentNames");
    print<layers::EnvironmentSource>("EnvironmentSource");
    print<layers::ReloadingFileOptions>("ReloadingFileOptions");
    print<layers::ReloadingFileSource>("ReloadingFileSource");
    print<layers::SqliteOptions>("SqliteOptions");
    print<layers::EtcdOptions>("EtcdOptions");
    print<http::ServerOptions>("ServerOptions");
    print<http::Server>("Server");
}

}  // namespace

int main() {
    printFramework();
    printValues();
    printStore();
    printService();
    printOptionalLibraries();
}
