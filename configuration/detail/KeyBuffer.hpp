#pragma once

#include <cstddef>
#include <string>
#include <utility>
#include <vector>

namespace velkor::configuration::detail {

/// Strings that have been used for keys, so that the next ones need no allocation.
class KeyBufferPool {
public:
    KeyBufferPool() { buffers.reserve(mostKept); }

private:
    friend class KeyBuffer;

    // Keys are put together for as many levels of calls between store and sources without a new
    // buffer.
    static constexpr std::size_t mostKept = 4;

    std::vector<std::string> buffers;
};

/// A form of one key that is not the caller's own string: with a group removed or added. Lent out
/// by a pool, so that a source that calls back into the store gets another one. Not thread-safe,
/// like the pool: both are used with the store's mutex held.
class KeyBuffer {
public:
    /// Takes a string from `lender`, which must live as long, when one is needed.
    explicit KeyBuffer(KeyBufferPool& lender) : pool(lender.buffers) {}

    ~KeyBuffer() {
        if (borrowed && pool.size() < KeyBufferPool::mostKept) pool.push_back(std::move(text));
    }

    KeyBuffer(const KeyBuffer&) = delete;
    KeyBuffer& operator=(const KeyBuffer&) = delete;

    /// `key` without `group`, which it begins with. Groups of the same size cut off the same.
    const std::string& within(const std::string& group, const std::string& key) {
        if (group.empty()) return key;
        if (group.size() != cutOff) {
            cutOff = group.size();
            buffer().assign(key, cutOff, std::string::npos);
        }
        return text;
    }

    /// `key` with `group` in front.
    const std::string& joined(const std::string& group, const std::string& key) {
        return group.empty() ? key : buffer().assign(group).append(key);
    }

private:
    std::string& buffer() {
        if (!borrowed && !pool.empty()) {
            text = std::move(pool.back());
            pool.pop_back();
        }
        borrowed = true;
        return text;
    }

    std::vector<std::string>& pool;
    std::string text;
    std::size_t cutOff = 0;
    bool borrowed = false;
};

}  // namespace velkor::configuration::detail
