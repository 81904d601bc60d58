#pragma once

#include <cstdint>
#include <exception>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <type_traits>
#include <utility>
#include <vector>

#include "framework/common/Mutex.hpp"
#include "settings/detail/Cell.hpp"
#include "settings/detail/SettingState.hpp"

namespace velkor::settings::detail {

/// Logs what a callback of the setting called `name` has thrown.
VELKOR_EXPORT void reportCallback(const std::string& name, const char* text);

/// A state with its value, published in a `Cell`, and the callbacks that are told of it. A `Cell`
/// that is a reference is not written to any more once `close` has returned.
template <class T, class Cell>
class ValueState : public SettingState {
public:
    using CellType = std::remove_reference_t<Cell>;
    using Callback = std::function<void(const T& before, const T& now)>;

    /// A state that publishes in what `published`, if anything, makes.
    template <class... Published>
    ValueState(std::string name, std::vector<Declared> keys, Published&... published)
        : SettingState(std::move(name), std::move(keys)), cell(published...) {}

    /// Tells `callback` of each change from now on; gives its number.
    std::uint64_t addCallback(Callback callback) {
        return addListener(std::make_shared<const Callback>(std::move(callback)));
    }

    Cell cell;

protected:
    /// Keeps what `judge` has found.
    void propose(std::optional<T> value) VELKOR_REQUIRES(gate) {
        candidate.reset();
        if (value) candidate = CellType::prepare(std::move(*value));
    }

private:
    void publish(const Listeners& told) override VELKOR_REQUIRES(gate) {
        if (told.empty()) return store();
        const auto before = cell.held();
        store();
        const auto now = cell.held();
        for (const Listener& each : told) {
            if (isListening(each)) {
                call(*static_cast<const Callback*>(each.callback.get()), *before, *now);
            }
        }
    }

    void store() VELKOR_REQUIRES(gate) {
        cell.store(std::move(*candidate));
        candidate.reset();
    }

    void call(const Callback& callback, const T& before, const T& now) const {
        try {
            callback(before, now);
        } catch (const std::exception& error) {
            reportCallback(name(), error.what());
        } catch (...) {
            reportCallback(name(), "no std::exception");
        }
    }

    std::optional<typename CellType::Prepared> candidate VELKOR_GUARDED_BY(gate);
};

}  // namespace velkor::settings::detail
