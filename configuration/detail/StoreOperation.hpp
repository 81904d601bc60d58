#pragma once

#include <exception>
#include <memory>
#include <stdexcept>
#include <string>

#include "configuration/ConfigurationImpl.hpp"
#include "configuration/Loggers.hpp"

namespace velkor::configuration {

/// The answer of an operation that is refused: a future that fails with `text`.
template <class T, class Error = std::runtime_error>
Future<T> failed(const std::string& text) {
    return makeFailedFuture<T>(std::make_exception_ptr(Error(text)));
}

/// One operation: a level of the store's mutex, and a reference to the store where foreign code,
/// which may give up all others, can run meanwhile.
class VELKOR_SCOPED_CAPABILITY ConfigurationImpl::Operation {
public:
    /// Begins an operation of `store`. `record`, if any, is logged before the mutex is taken.
    template <class... Record>
    explicit Operation(ConfigurationImpl& store, const Record&... record)
        VELKOR_ACQUIRE(store.storeLock)
        : keepAlive(announced(store, record...)), level(store.storeLock) {
        if (keepAlive == nullptr && store.foreignCodeMayRun()) {
            keepAlive = store.weak_from_this().lock();
        }
    }

    ~Operation() VELKOR_RELEASE() = default;

    Operation(const Operation&) = delete;
    Operation& operator=(const Operation&) = delete;

    detail::StoreLock::Level& mutexLevel() { return level; }

private:
    using Reference = std::shared_ptr<const Configuration>;

    static Reference announced(const ConfigurationImpl&) { return nullptr; }

    // A log sink may give up the last reference to the store on the first record already.
    template <class... Record>
    static Reference announced(const ConfigurationImpl& store, const Record&... record) {
        if (!storeLogger.isEnabled(common::debug)) return nullptr;
        auto reference = store.weak_from_this().lock();
        storeLogger.write(common::debug, record...);
        return reference;
    }

    // Destroyed from the last to the first: what the store has let go of goes with the level, then
    // perhaps the store itself.
    Reference keepAlive;
    detail::StoreLock::Level level;
};

}  // namespace velkor::configuration
