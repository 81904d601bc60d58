#pragma once

#include <cstdint>
#include <functional>
#include <string>
#include <string_view>
#include <unordered_map>

namespace velkor::layers::detail {

/// What the system tells of changes in folders and of files. One thread at a time uses it.
class Inotify {
public:
    /// What happened, as inotify(7) says it.
    struct Event {
        int watch;
        std::uint32_t mask;
        std::string_view name;  ///< In a folder; empty for a watched file itself.
    };

    Inotify() = default;
    ~Inotify();

    Inotify(const Inotify&) = delete;
    Inotify& operator=(const Inotify&) = delete;

    /// Watches what is at `path` for the events of `mask`, beside those that it is watched for
    /// already. Gives the number of the watch, the same for the same folder or file, or the negated
    /// error of the system, which may have set limits (ENOSPC, EMFILE).
    int watch(const std::string& path, std::uint32_t mask);

    /// Takes back one `watch` that gave this number.
    void forget(int watch) noexcept;

    /// Tells the next events that there are, the oldest first. Waits for none.
    void read(const std::function<void(const Event&)>& tell);

    /// Readable when there are events; -1 as long as nothing is watched.
    int descriptor() const noexcept { return instance; }

private:
    int instance = -1;
    std::unordered_map<int, unsigned> uses;  // of each watch
};

}  // namespace velkor::layers::detail
