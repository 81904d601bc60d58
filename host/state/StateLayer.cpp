#include "host/state/StateLayer.hpp"

#include <stdexcept>

#if VELKOR_HAS_SQLITE
#include "host/state/SqliteState.hpp"
#endif

namespace velkor::host {

std::shared_ptr<StateLayer> openState(const std::string& path,
                                      [[maybe_unused]] const std::string& author) {
#if VELKOR_HAS_SQLITE
    return std::make_shared<SqliteState>(path, author);
#else
    throw std::runtime_error(
        "--state needs velkor::sqlite, which this velkor-config was built without: " + path);
#endif
}

}  // namespace velkor::host
