#include "settings/ChangeHandle.hpp"

#include <utility>

#include "settings/detail/SettingState.hpp"

namespace velkor::settings {

ChangeHandle::ChangeHandle(std::weak_ptr<detail::SettingState> changing,
                           std::uint64_t callback) noexcept
    : state(std::move(changing)), id(callback) {}

ChangeHandle& ChangeHandle::operator=(ChangeHandle&& other) noexcept {
    ChangeHandle taken(std::move(other));
    state.swap(taken.state);
    std::swap(id, taken.id);
    return *this;
}

ChangeHandle::~ChangeHandle() {
    cancel();
}

void ChangeHandle::cancel() {
    // The callback that is destroyed may own this handle.
    const auto changing = std::exchange(state, {}).lock();
    if (changing != nullptr) changing->endCallback(id);
}

}  // namespace velkor::settings
