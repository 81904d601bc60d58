#include "settings/Status.hpp"

#include "settings/Setting.hpp"

namespace velkor::settings::detail {

Status statusOf(const SettingState& state) {
    const Standing standing = state.standings().front();
    return {state.keys().front().shown(standing.value), standing.source, standing.since,
            state.lastError(), state.isStoreGone()};
}

}  // namespace velkor::settings::detail
