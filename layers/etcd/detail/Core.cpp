#include "layers/etcd/detail/Core.hpp"

#include "layers/etcd/detail/GatewayErrors.hpp"

namespace velkor::layers::etcd {

void Core::change(const Mutation& mutation) const {
    bool isMade = false;
    bool hasTable = true;
    try {
        hasTable = changeTable([&](configuration::ValueTable& table) {
            auto changed = mutation(table);
            isMade = true;
            return changed;
        });
    } catch (...) {
        if (!isMade) throw;
    }
    if (!hasTable) throw Stopped();
}

}  // namespace velkor::layers::etcd
