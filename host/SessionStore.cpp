#include "host/SessionStore.hpp"

#include <utility>

#include "configuration/sources/DurableSource.hpp"
#include "framework/common/TextConversion.hpp"
#include "host/console/InterruptibleWait.hpp"
#include "host/console/Interruption.hpp"
#include "host/sources/PropertyFile.hpp"

namespace velkor::host {

using configuration::ConfigurationValue;

void SessionStore::keepStateIn(std::shared_ptr<StateLayer> layer) {
    removeSource("override").get();
    addSource(stateSource, "", 0, false, layer->source()).get();
    stateLayer = std::move(layer);
}

Future<ConfigurationValue> SessionStore::get(const std::string& key) {
    if (Interruption::isRequestedHere()) throw Interrupted();
    return ConfigurationImpl::get(key);
}

Future<ConfigurationValue> SessionStore::set(const std::string& key, ConfigurationValue value) {
    noteWrite();
    return ConfigurationImpl::set(key, std::move(value));
}

Future<ConfigurationValue> SessionStore::set(const std::string& key, ConfigurationValue value,
                                             const std::string& sourceName) {
    noteWrite();
    return ConfigurationImpl::set(key, std::move(value), sourceName);
}

Future<bool> SessionStore::addPropertyFileSource(const std::string& name, const std::string& group,
                                                 int order, bool readOnly,
                                                 const std::u16string& path) {
    const std::string narrowPath = common::TextConversion("UTF-8").fromUtf16(path);
    return addSource(name, group, order, readOnly, loadPropertyFile(narrowPath, limits));
}

void SessionStore::acknowledge() {
    if (!written.exchange(false)) return;
    if (stateLayer != nullptr) resultUnlessInterrupted(stateLayer->committed());
    for (const auto& description : describeSources().get()) {
        const auto source = findSource(description.name).get();
        if (stateLayer != nullptr && source == stateLayer->source()) continue;
        auto* const durable = dynamic_cast<configuration::DurableSource*>(source.get());
        if (durable != nullptr) resultUnlessInterrupted(durable->committed());
    }
}

}  // namespace velkor::host
