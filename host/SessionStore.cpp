#include "host/SessionStore.hpp"

#include "framework/common/TextConversion.hpp"
#include "host/console/Interruption.hpp"
#include "host/sources/PropertyFile.hpp"

namespace velkor::host {

Future<configuration::ConfigurationValue> SessionStore::get(const std::string& key) {
    if (Interruption::isRequested()) throw Interrupted();
    return ConfigurationImpl::get(key);
}

Future<bool> SessionStore::addPropertyFileSource(const std::string& name, const std::string& group,
                                                 int order, bool readOnly,
                                                 const std::u16string& path) {
    const std::string narrowPath = common::TextConversion("UTF-8").fromUtf16(path);
    return addSource(name, group, order, readOnly, loadPropertyFile(narrowPath, limits));
}

}  // namespace velkor::host
