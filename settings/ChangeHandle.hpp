#pragma once

#include <cstdint>
#include <memory>

#include "framework/common/Export.hpp"

namespace velkor::settings {

namespace detail {
class SettingState;
}

/// Owns the wish to be told of changes of a setting: ends it when it is destroyed. Move-only; may
/// outlive the setting.
///
/// Once it is destroyed the callback runs no more: a call that is running on another thread is
/// waited for, so hold no lock that the callback or the store needs. May be destroyed in its own
/// callback. One thread at a time uses one handle.
class VELKOR_EXPORT ChangeHandle {
public:
    /// A handle on nothing.
    ChangeHandle() noexcept = default;

    /// For `onChange` of settings.
    ChangeHandle(std::weak_ptr<detail::SettingState> changing, std::uint64_t callback) noexcept;

    ChangeHandle(ChangeHandle&& other) noexcept = default;

    /// Takes over the callback of `other`; the one held before is ended.
    ChangeHandle& operator=(ChangeHandle&& other) noexcept;

    ~ChangeHandle();

    /// Ends it now. Does nothing on an empty handle.
    void cancel();

private:
    std::weak_ptr<detail::SettingState> state;
    std::uint64_t id = 0;
};

}  // namespace velkor::settings
