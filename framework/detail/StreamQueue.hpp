#pragma once

#include <cstdint>
#include <iterator>
#include <list>
#include <stdexcept>
#include <string>
#include <string_view>
#include <unordered_map>
#include <utility>

namespace velkor::detail {

/// The newest undelivered values of a stream, oldest first, at most as many as its capacity. Not
/// thread-safe: guarded by the stream's mutex. Destroys no value: what is dropped is given out.
template <class T>
class NewestValues {
public:
    /// A queue of `mostKept` values. Throws `std::invalid_argument` "A publisher needs a capacity
    /// of at least 1." when that is 0.
    explicit NewestValues(std::uint64_t mostKept) : capacity(mostKept) {
        if (capacity == 0) {
            throw std::invalid_argument("A publisher needs a capacity of at least 1.");
        }
    }

    bool empty() const noexcept { return values.empty(); }

    /// Adds `value`; `dropped` takes what no longer fits.
    void push(T&& value, std::list<T>& dropped) {
        values.push_back(std::move(value));
        while (values.size() > capacity) dropped.splice(dropped.end(), values, values.begin());
    }

    /// Takes the one value in `first` unless there are some already.
    void pushFirst(std::list<T>& first) noexcept {
        if (values.empty()) values.swap(first);
    }

    /// Takes the value that is due first; there is one.
    std::list<T> takeFirst() noexcept {
        std::list<T> first;
        first.splice(first.end(), values, values.begin());
        return first;
    }

    std::list<T> takeAll() noexcept { return std::exchange(values, {}); }

private:
    const std::uint64_t capacity;
    std::list<T> values;  // a list holds nothing while empty
};

/// The newest undelivered value of each key, the key that has waited longest first. `KeyOf` gives
/// the key of a value as a `const std::string&`. Otherwise as `NewestValues`.
template <class T, class KeyOf>
class NewestByKey {
public:
    bool empty() const noexcept { return values.empty(); }

    /// Takes the one value in `added`, in the place of the one with the same key, if any, which
    /// goes to `dropped`. When memory is short, nothing has changed.
    void push(std::list<T>& added, std::list<T>& dropped) {
        const auto node = added.begin();
        const auto known = byKey.find(keyOf(*node));
        if (known == byKey.end()) {
            byKey.emplace(keyOf(*node), node);
            values.splice(values.end(), added);
            return;
        }
        const auto replaced = known->second;
        auto entry = byKey.extract(known);
        entry.key() = keyOf(*node);
        entry.mapped() = node;
        byKey.insert(std::move(entry));
        values.splice(replaced, added);
        dropped.splice(dropped.end(), values, replaced);
    }

    /// Takes the value that is due first; there is one.
    std::list<T> takeFirst() noexcept {
        byKey.erase(keyOf(values.front()));
        std::list<T> first;
        first.splice(first.end(), values, values.begin());
        return first;
    }

    std::list<T> takeAll() noexcept {
        byKey.clear();
        return std::exchange(values, {});
    }

private:
    static std::string_view keyOf(const T& value) noexcept { return KeyOf()(value); }

    std::list<T> values;
    std::unordered_map<std::string_view, typename std::list<T>::iterator> byKey;  // into `values`
};

}  // namespace velkor::detail
