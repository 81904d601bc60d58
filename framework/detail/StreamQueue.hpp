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
        if (values.empty()) return values.swap(added);
        if (keyOf(values.front()) == keyOf(*node)) return replace(values.begin(), added, dropped);
        const auto known = others.find(keyOf(*node));
        if (known == others.end()) {
            others.emplace(keyOf(*node), node);
            values.splice(values.end(), added);
            return;
        }
        const auto replaced = known->second;
        auto entry = others.extract(known);
        entry.key() = keyOf(*node);
        entry.mapped() = node;
        others.insert(std::move(entry));
        replace(replaced, added, dropped);
    }

    /// Takes the value that is due first; there is one.
    std::list<T> takeFirst() noexcept {
        std::list<T> first;
        first.splice(first.end(), values, values.begin());
        if (!values.empty()) others.erase(keyOf(values.front()));
        return first;
    }

    std::list<T> takeAll() noexcept {
        others.clear();
        return std::exchange(values, {});
    }

private:
    using Position = typename std::list<T>::iterator;

    static std::string_view keyOf(const T& value) noexcept { return KeyOf()(value); }

    void replace(Position replaced, std::list<T>& added, std::list<T>& dropped) noexcept {
        values.splice(replaced, added);
        dropped.splice(dropped.end(), values, replaced);
    }

    std::list<T> values;
    // Where the values behind the first are: a stream that keeps up has one at most.
    std::unordered_map<std::string_view, Position> others;
};

}  // namespace velkor::detail
