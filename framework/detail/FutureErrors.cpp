#include "framework/detail/FutureErrors.hpp"

#include <stdexcept>
#include <utility>

namespace velkor::detail {

namespace {

// Its copies share its text. Destroyed when the library is unloaded; what was thrown lives on.
const std::runtime_error preparedBrokenPromise(future_errors::brokenPromise);

}  // namespace

void throwFutureError(const char* text) {
    throw std::runtime_error(text);
}

void rethrowUnwrapped(std::exception_ptr error) {
    if (error == nullptr) throw std::runtime_error(preparedBrokenPromise);
    try {
        std::rethrow_exception(std::move(error));
    } catch (const std::exception_ptr& wrapped) {
        if (wrapped == nullptr) throw;
        std::rethrow_exception(wrapped);
    }
}

void requireException(const std::exception_ptr& error) {
    if (error == nullptr) throw std::invalid_argument(future_errors::nullException);
}

}  // namespace velkor::detail
