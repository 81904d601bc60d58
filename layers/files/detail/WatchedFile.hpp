#pragma once

#include <atomic>
#include <chrono>
#include <cstdint>
#include <filesystem>
#include <functional>
#include <optional>
#include <string>
#include <vector>

#include "layers/files/detail/FileIdentity.hpp"
#include "layers/files/detail/Inotify.hpp"
#include "layers/files/detail/PathChain.hpp"
#include "layers/files/detail/QuietTime.hpp"

namespace velkor::layers::detail {

/// How a file was when it was read last.
struct Look {
    std::optional<FileIdentity> identity{};
    bool isGood = true;  ///< It could be read.
};

/// One file on the thread that looks after all: decides when it is read again.
///
/// It is when the system tells that it was closed after writing, replaced or removed, on whatever
/// way over links and folders the path leads to it; and, where the system tells nothing, when it
/// has changed and stood still from one look at it to the next.
///
/// All but `end` and `hasEnded` is for that thread only.
class WatchedFile {
public:
    using TimePoint = QuietTime::TimePoint;

    /// Reads the file; nothing if it changed meanwhile.
    using Reload = std::function<std::optional<Look>()>;

    /// Looks after the file at `path`, which is absolute, and was last read as `last` says. Looks
    /// at it itself every `interval`.
    WatchedFile(std::filesystem::path path, std::chrono::milliseconds interval, Look last,
                Reload reload);

    /// The file is looked after no more. From any thread, without waiting.
    void end() noexcept { ended.store(true, std::memory_order_relaxed); }
    bool hasEnded() const noexcept { return ended.load(std::memory_order_relaxed); }

    /// Begins to watch. `onEvent`, `onTime` and `stop` get the same `notifications`.
    void start(Inotify& notifications, TimePoint now);

    void stop(Inotify& notifications) noexcept;

    /// Hears of one event, whatever file it is about.
    void onEvent(Inotify& notifications, const Inotify::Event& event, TimePoint now);

    /// Does what is due.
    void onTime(Inotify& notifications, TimePoint now);

    /// When something will be due.
    TimePoint nextTime() const;

    const std::filesystem::path& path() const noexcept { return place; }

private:
    // A watch for one name in a folder, or for the file itself, without a name.
    struct Armed {
        int watch;
        std::string folder;
        std::string name;
    };

    void arm(Inotify& notifications);
    static int watchAll(Inotify& notifications, const PathChain& way, std::vector<Armed>& watches);
    static void forgetAll(Inotify& notifications, std::vector<Armed>& watches) noexcept;
    void say(int error);
    const Armed* concerned(const Inotify::Event& event) const;
    void onFileEvent(std::uint32_t mask, TimePoint now);
    void onNameEvent(std::uint32_t mask, const std::string& name, TimePoint now);
    void look(Inotify& notifications, TimePoint now);

    const std::filesystem::path place;
    const std::chrono::milliseconds interval;
    const Reload reload;
    std::atomic<bool> ended{false};

    Look last;
    std::optional<FileIdentity> looked;  // at the last look
    TimePoint nextLook{};
    QuietTime quietTime;
    PathChain chain;
    std::vector<Armed> armed;
    int unwatched = 0;  // why some of it can't be watched, as an error of the system
};

}  // namespace velkor::layers::detail
