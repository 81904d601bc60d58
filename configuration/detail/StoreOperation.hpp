#pragma once

#include <exception>
#include <memory>
#include <stdexcept>
#include <string>
#include <utility>

#include "configuration/ConfigurationImpl.hpp"
#include "configuration/Loggers.hpp"
#include "framework/detail/SharedFutureState.hpp"

namespace velkor::configuration {

/// The answer of an operation that is refused: a future that fails with `text`.
template <class T, class Error = std::runtime_error>
Future<T> failed(const std::string& text) {
    return makeFailedFuture<T>(std::make_exception_ptr(Error(text)));
}

/// The answer of an operation that changes the store: a resolved future whose memory is taken
/// before anything is changed, so that nothing fails for want of it afterwards.
template <class T>
class Answer {
public:
    Answer()
        : box(std::make_unique<T>()), value(*box), state(std::make_shared<State>(std::move(box))) {}

    /// The future of `result`. To be called once.
    template <class Result>
    Future<T> with(Result&& result) {
        value = std::forward<Result>(result);
        return Future<T>(std::move(state));
    }

private:
    using State = velkor::detail::SharedFutureState<T>;

    // Nobody else has the state before `with` gives it away.
    std::unique_ptr<T> box;
    T& value;
    std::shared_ptr<State> state;
};

/// One operation: a level of the store's mutex. The outermost one holds a reference to the store
/// where foreign code, which may give up all others, can run meanwhile.
class VELKOR_SCOPED_CAPABILITY ConfigurationImpl::Operation {
public:
    /// Begins an operation of `store`. `record`, if any, is logged before the mutex is taken.
    template <class... Record>
    explicit Operation(ConfigurationImpl& store, const Record&... record)
        VELKOR_ACQUIRE(store.storeLock)
        : keepAlive(announced(store, record...)), level(store.storeLock) {
        if (keepAlive == nullptr && level.isOutermost() && store.foreignCodeMayRun()) {
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
