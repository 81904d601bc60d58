#pragma once

#include <cstddef>
#include <cstdint>
#include <set>
#include <string>
#include <string_view>
#include <vector>

namespace velkor::configuration {

/// A table of texts that never changes. All keys and values stand in one text, so that a key costs
/// no block of the heap of its own: some 40 bytes beside its own and its value's.
///
/// Concurrent calls are safe. What it gives refers to the table.
class TextTable {
public:
    /// Where a key begins in the text, and where its value does, directly behind it. The value
    /// ends where the next key begins.
    struct Property {
        std::size_t key;
        std::size_t value;
    };

    /// Takes over `content` and the places of keys and values in it, from its beginning on without
    /// a gap. The last place is that of no key: both its parts are the size of `content`. Of
    /// properties with the same key the last one counts.
    TextTable(std::string content, std::vector<Property> places);

    /// The property of `key`, or null.
    const Property* find(std::string_view key) const noexcept {
        const Slot slot = slots[slotOf(key, hashOf(key))];
        return slot == emptySlot ? nullptr : &propertyIn(slot);
    }

    /// The value of `property`, which is one of this table.
    std::string_view valueOf(const Property& property) const noexcept {
        return textBetween(property.value, (&property + 1)->key);
    }

    /// The value of `key`; `std::out_of_range` "_Map_base::at" when there is none.
    std::string_view at(std::string_view key) const;

    /// All keys, sorted byte by byte.
    std::set<std::string> keys() const;

    /// How many properties there are, those that don't count included.
    std::size_t size() const noexcept { return properties.size() - 1; }

    /// The key of the property with that number, from 0 on in the order of their places.
    std::string_view key(std::size_t number) const noexcept { return keyOf(properties[number]); }

    /// The number of the property that counts for the key of that one.
    std::size_t counting(std::size_t number) const noexcept {
        return static_cast<std::size_t>(find(key(number)) - properties.data());
    }

private:
    // The number of a property, from 1 on, and above it the upper bits of the hash of its key.
    using Slot = std::uint64_t;

    static constexpr Slot emptySlot = 0;
    static constexpr unsigned numberBits = 40;
    static constexpr Slot numberMask = (Slot{1} << numberBits) - 1;

    std::uint64_t hashOf(std::string_view key) const noexcept;

    std::size_t slotOf(std::string_view key, std::uint64_t hash) const noexcept;

    const Property& propertyIn(Slot slot) const noexcept {
        return properties[(slot & numberMask) - 1];
    }

    std::string_view keyOf(const Property& property) const noexcept {
        return textBetween(property.key, property.value);
    }

    std::string_view textBetween(std::size_t begin, std::size_t end) const noexcept {
        return {text.data() + begin, end - begin};
    }

    std::string text;
    std::vector<Property> properties;
    std::vector<Slot> slots;         // a power of two of them, at least half of them empty
    const std::uint64_t hashFactor;  // nobody knows it: no file can have all its keys in one slot
};

}  // namespace velkor::configuration
