#include "configuration/sources/TextTable.hpp"

#include <cstring>
#include <random>
#include <stdexcept>
#include <utility>

#include "configuration/StoreErrors.hpp"

namespace velkor::configuration {

namespace {

using Word = std::uint64_t;

Word drawOddWord() {
    std::random_device device;
    constexpr unsigned half = 32;
    return Word{device()} << half | device() | 1U;
}

// One for the process: drawing it takes the processor longer than filling a small table.
Word oddWord() {
    static const Word drawn = drawOddWord();
    return drawn;
}

// Their product, its upper half folded into the lower one, so that each bit depends on all bits.
Word scatter(Word word, Word factor) noexcept {
    __extension__ using Product = unsigned __int128;
    constexpr unsigned width = 64;
    const Product product = Product{word} * factor;
    return static_cast<Word>(product) ^ static_cast<Word>(product >> width);
}

Word wordAt(const char* bytes) noexcept {
    Word word = 0;
    std::memcpy(&word, bytes, sizeof word);
    return word;
}

// A text that is shorter than a word, zeros behind it.
Word shortWord(std::string_view text) noexcept {
    char bytes[sizeof(Word)] = {};
    text.copy(bytes, sizeof bytes);
    return wordAt(bytes);
}

// The number of slots for so many keys: a power of two, at least twice as many.
std::size_t slotsFor(std::size_t keys) {
    std::size_t count = 2;
    while (count < 2 * keys) count *= 2;
    return count;
}

}  // namespace

TextTable::TextTable(std::string content, std::vector<Property> places)
    : text(std::move(content)),
      properties(std::move(places)),
      slots(slotsFor(properties.size()), emptySlot),
      hashFactor(oddWord()) {
    text.shrink_to_fit();
    properties.shrink_to_fit();
    for (Slot number = 1; number < properties.size(); ++number) {
        const std::string_view key = keyOf(propertyIn(number));
        const std::uint64_t hash = hashOf(key);
        slots[slotOf(key, hash)] = (hash & ~numberMask) | number;
    }
}

std::string_view TextTable::at(std::string_view key) const {
    const Property* const property = find(key);
    if (property == nullptr) throw std::out_of_range(store_errors::notInTable);
    return valueOf(*property);
}

std::set<std::string> TextTable::keys() const {
    std::set<std::string> sorted;
    // Files are often sorted already. A key that comes more than once is one key.
    for (std::size_t number = 0; number + 1 < properties.size(); ++number) {
        sorted.emplace_hint(sorted.end(), keyOf(properties[number]));
    }
    return sorted;
}

// By words; the last one may overlap the one before it.
std::uint64_t TextTable::hashOf(std::string_view key) const noexcept {
    Word hash = key.size();
    if (key.size() < sizeof(Word)) return scatter(hash ^ shortWord(key), hashFactor);
    const char* bytes = key.data();
    const char* const last = bytes + key.size() - sizeof(Word);
    for (; bytes < last; bytes += sizeof(Word)) hash = scatter(hash ^ wordAt(bytes), hashFactor);
    return scatter(hash ^ wordAt(last), hashFactor);
}

// The slot that holds `key`, or the empty one where it would have to stand.
std::size_t TextTable::slotOf(std::string_view key, std::uint64_t hash) const noexcept {
    const std::size_t mask = slots.size() - 1;
    for (std::size_t number = hash & mask;; number = (number + 1) & mask) {
        const Slot slot = slots[number];
        if (slot == emptySlot) return number;
        if (((slot ^ hash) & ~numberMask) == 0 && keyOf(propertyIn(slot)) == key) return number;
    }
}

}  // namespace velkor::configuration
