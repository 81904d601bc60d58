#include "settings/Status.hpp"

#include <cstddef>

#include "settings/Bound.hpp"
#include "settings/Setting.hpp"

namespace velkor::settings::detail {

Status statusOf(const SettingState& state) {
    const Standing standing = state.standings().front();
    return {state.keys().front().shown(standing.value), standing.source, standing.since,
            state.lastError(), state.isStoreGone()};
}

BoundStatus boundStatusOf(const SettingState& state) {
    BoundStatus status{{}, state.lastError(), state.isStoreGone()};
    const auto standings = state.standings();
    for (std::size_t i = 0; i < standings.size(); ++i) {
        const Declared& key = state.keys()[i];
        status.fields[key.key] = {key.shown(standings[i].value), standings[i].source,
                                  standings[i].since, std::nullopt, status.storeGone};
    }
    return status;
}

}  // namespace velkor::settings::detail
