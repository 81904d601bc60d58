#include "layers/etcd/detail/Core.hpp"

#include "layers/etcd/Loggers.hpp"
#include "layers/etcd/detail/GatewayErrors.hpp"

namespace velkor::layers::etcd {

void Core::change(const Mutation& mutation) const {
    if (!changeTable(mutation)) throw Stopped();
}

void report(common::Severity severity, const std::string& text) noexcept {
    try {
        etcdLogger.write(severity, text);
    } catch (...) {
        return;
    }
}

}  // namespace velkor::layers::etcd
