#include "layers/files/detail/WatchedFile.hpp"

#include <fcntl.h>
#include <sys/inotify.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <system_error>
#include <utility>

#include "layers/files/Loggers.hpp"

namespace velkor::layers::detail {

namespace {

// What is asked of the folders on the way; of the last one beside it; and of the file itself, which
// may be written by another of its names, or through another mount.
constexpr std::uint32_t nameEvents = IN_CREATE | IN_MOVED_FROM | IN_MOVED_TO | IN_DELETE;
constexpr std::uint32_t folderMask = nameEvents | IN_ONLYDIR | IN_DONT_FOLLOW;
constexpr std::uint32_t lastFolderMask = folderMask | IN_CLOSE_WRITE;
constexpr std::uint32_t fileMask = IN_CLOSE_WRITE | IN_MODIFY | IN_ATTRIB | IN_DONT_FOLLOW;
constexpr std::uint32_t watchEnded = IN_IGNORED | IN_UNMOUNT;

constexpr int noWatch = -1;

bool isReadable(const std::filesystem::path& path) {
    return ::faccessat(AT_FDCWD, path.c_str(), R_OK, AT_EACCESS) == 0;
}

// Whether what was just created at `path` is a file that is open for its first writing. A link, of
// either kind, leads to a file that is there already.
bool isNewFile(const std::string& path) {
    struct stat status {};
    return ::lstat(path.c_str(), &status) == 0 && S_ISREG(status.st_mode) && status.st_nlink == 1;
}

// The folder or file was there a moment ago: the way has changed, and is gone anew.
bool hasVanished(int error) {
    return error == ENOENT || error == ENOTDIR || error == ELOOP;
}

}  // namespace

WatchedFile::WatchedFile(std::filesystem::path path, std::chrono::milliseconds lookInterval,
                         Look lastLook, Reload reloading)
    : place(std::move(path)),
      interval(lookInterval),
      reload(std::move(reloading)),
      last(lastLook),
      looked(lastLook.identity) {}

void WatchedFile::start(Inotify& notifications, TimePoint now) {
    nextLook = now + interval;
    arm(notifications);
    if (identityOf(place) == last.identity) return;
    quietTime.changed(now);
    quietTime.written();  // maybe it still is
}

void WatchedFile::stop(Inotify& notifications) noexcept {
    forgetAll(notifications, armed);
}

void WatchedFile::onEvent(Inotify& notifications, const Inotify::Event& event, TimePoint now) {
    if ((event.mask & IN_Q_OVERFLOW) != 0) {
        arm(notifications);
        return quietTime.changed(now);
    }
    const Armed* const told = concerned(event);
    if (told == nullptr) return;
    if ((event.mask & watchEnded) != 0) {
        arm(notifications);
        return quietTime.changed(now);
    }
    const std::string name = told->folder + '/' + told->name;
    if ((event.mask & nameEvents) != 0) arm(notifications);
    if (event.name.empty()) return onFileEvent(event.mask, now);
    onNameEvent(event.mask, name, now);
}

const WatchedFile::Armed* WatchedFile::concerned(const Inotify::Event& event) const {
    const bool anyName = (event.mask & watchEnded) != 0;
    const auto found = std::find_if(armed.begin(), armed.end(), [&](const Armed& each) {
        return each.watch == event.watch && (anyName || each.name == event.name);
    });
    return found == armed.end() ? nullptr : &*found;
}

void WatchedFile::onFileEvent(std::uint32_t mask, TimePoint now) {
    if ((mask & IN_MODIFY) != 0) quietTime.written();
    if ((mask & IN_CLOSE_WRITE) != 0) quietTime.changed(now);
    // Who may read it matters only where it begins or ends to be readable.
    const bool mayMatter = (mask & IN_ATTRIB) != 0;
    if (mayMatter && (!last.isGood || !isReadable(place))) quietTime.changed(now);
}

void WatchedFile::onNameEvent(std::uint32_t mask, const std::string& name, TimePoint now) {
    const bool created = (mask & IN_CREATE) != 0;
    if (created && isNewFile(name)) return quietTime.begun();
    quietTime.changed(now);
    // What is in a new folder already may still be being written.
    if (created && (mask & IN_ISDIR) != 0 && !chain.file().empty()) quietTime.written();
}

void WatchedFile::onTime(Inotify& notifications, TimePoint now) {
    if (now >= nextLook) look(notifications, now);
    const auto due = quietTime.due();
    if (!due || now < *due) return;
    quietTime.reset();
    last.isGood = false;  // what throws is tried again at the next look
    if (const auto reading = reload()) {
        last = *reading;
    } else {
        quietTime.changed(now);
    }
}

// Where the system tells of nothing, as in a file system of the network. A file that is not the
// same at two looks is still being written.
void WatchedFile::look(Inotify& notifications, TimePoint now) {
    nextLook = now + interval;
    if (unwatched != 0 || PathChain(place) != chain) arm(notifications);
    const auto identity = identityOf(place);
    const bool standsStill = identity == looked;
    looked = identity;
    if (!standsStill || quietTime.due()) return;
    const bool mayBeGoodAgain = identity && !last.isGood;
    if (identity != last.identity || mayBeGoodAgain) quietTime.changed(now);
}

WatchedFile::TimePoint WatchedFile::nextTime() const {
    const auto due = quietTime.due();
    return due ? std::min(*due, nextLook) : nextLook;
}

// Watches the way that the path leads now. What changes before all of it is watched shows in a
// second walk; what changes later is told.
void WatchedFile::arm(Inotify& notifications) {
    constexpr int mostWalks = 8;  // the next look goes on where somebody changes it all the time
    int error = 0;
    chain = {};  // for the next look to begin anew, if there is no memory now
    PathChain next(place);
    for (int walks = 0; walks < mostWalks && next != chain; ++walks) {
        std::vector<Armed> watches;
        try {
            error = watchAll(notifications, next, watches);
        } catch (...) {
            forgetAll(notifications, watches);
            throw;
        }
        armed.swap(watches);
        forgetAll(notifications, watches);
        chain = std::exchange(next, PathChain(place));
    }
    say(error);
}

// Gives the first error that is not a sign of a change.
int WatchedFile::watchAll(Inotify& notifications, const PathChain& way,
                          std::vector<Armed>& watches) {
    int error = 0;
    const auto add = [&](const std::string& where, std::uint32_t mask, const std::string& name) {
        // Its place is there before the watch is: what has no memory leaves none behind.
        watches.push_back({noWatch, where, name});
        const int watch = notifications.watch(where, mask);
        if (watch >= 0) {
            watches.back().watch = watch;
            return;
        }
        watches.pop_back();
        if (error == 0 && !hasVanished(-watch)) error = -watch;
    };
    for (const auto& step : way.steps()) {
        const bool isLast = &step == &way.steps().back();
        add(step.folder, isLast ? lastFolderMask : folderMask, step.name);
    }
    if (!way.file().empty()) add(way.file(), fileMask, "");
    return error;
}

void WatchedFile::forgetAll(Inotify& notifications, std::vector<Armed>& watches) noexcept {
    for (const auto& each : watches) notifications.forget(each.watch);
    watches.clear();
}

void WatchedFile::say(int error) {
    if (std::exchange(unwatched, error) == error) return;
    if (error == 0) {
        filesLogger.write(common::warning, "Property file is watched again: ", place.string());
        return;
    }
    filesLogger.write(common::warning, "Property file can't be watched and is looked at every ",
                      interval.count(), " ms: ", place.string(), ": ",
                      std::system_category().message(error));
}

}  // namespace velkor::layers::detail
