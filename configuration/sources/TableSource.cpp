#include "configuration/sources/TableSource.hpp"

#include <utility>

namespace velkor::configuration {

TableSource::TableSource(const std::type_info& answeringClass, ValueMap&& initialValues,
                         Code calledCode)
    : values(std::move(initialValues)), answering(answeringClass), code(calledCode) {}

TableSource::~TableSource() = default;

ConfigurationValue TableSource::get(const std::string& key) {
    return values.at(key);
}

bool TableSource::has(const std::string& key) {
    return static_cast<const ValueTable&>(values).find(key) != nullptr;
}

void TableSource::setChangeListener(ChangeListener newListener) {
    listener.swap(newListener);
}

std::set<std::string> TableSource::keys() {
    return values.keys();
}

void TableSource::notify(const std::string& key) const {
    if (listener) listener(key);
}

}  // namespace velkor::configuration
