#include "layers/files/detail/FileWatcher.hpp"

#include <poll.h>
#include <pthread.h>
#include <sys/eventfd.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <chrono>
#include <cstdint>
#include <limits>
#include <list>
#include <system_error>
#include <utility>

#include "framework/common/Mutex.hpp"
#include "layers/files/Loggers.hpp"

namespace velkor::layers::detail {

using common::Mutex;
using common::MutexLock;

namespace {

// Wakes the thread.
class Bell {
public:
    Bell() : descriptor(::eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK)) {
        if (descriptor < 0) throw std::system_error(errno, std::system_category(), "eventfd");
    }
    ~Bell() { ::close(descriptor); }

    Bell(const Bell&) = delete;
    Bell& operator=(const Bell&) = delete;

    // Fails only when it has been rung often and not been heard yet.
    void ring() const noexcept {
        const std::uint64_t once = 1;
        [[maybe_unused]] const auto written = ::write(descriptor, &once, sizeof once);
    }

    void silence() const noexcept {
        std::uint64_t rung = 0;
        [[maybe_unused]] const auto size = ::read(descriptor, &rung, sizeof rung);
    }

    const int descriptor;
};

int millisecondsUntil(QuietTime::TimePoint time, QuietTime::TimePoint now) {
    const auto left = std::chrono::ceil<std::chrono::milliseconds>(time - now).count();
    constexpr auto most = std::chrono::milliseconds::rep{std::numeric_limits<int>::max()};
    return static_cast<int>(std::clamp(left, std::chrono::milliseconds::rep{0}, most));
}

}  // namespace

// What the thread works on. It outlives the watcher where that ends on the thread itself.
class FileWatcher::Work {
public:
    void run() {
        ::pthread_setname_np(::pthread_self(), "velkor-files");
        while (takeOrders()) {
            waitForEvents();
            notifications.read([this](const Inotify::Event& event) {
                forEachFile([&](WatchedFile& file) { file.onEvent(notifications, event, now()); });
            });
            forEachFile([this](WatchedFile& file) { file.onTime(notifications, now()); });
        }
    }

    void add(std::shared_ptr<WatchedFile> file) VELKOR_EXCLUDES(mutex) {
        const MutexLock lock(mutex);
        added.push_back(std::move(file));
        bell.ring();
    }

    void end() VELKOR_EXCLUDES(mutex) {
        const MutexLock lock(mutex);
        ended = true;
        bell.ring();
    }

    void ring() const noexcept { bell.ring(); }

private:
    // Grows where a file is added: the thread itself has nobody to tell that there is no memory.
    using Files = std::list<std::shared_ptr<WatchedFile>>;

    static QuietTime::TimePoint now() { return std::chrono::steady_clock::now(); }

    // Whether to go on.
    bool takeOrders() VELKOR_EXCLUDES(mutex) {
        bell.silence();
        Files arrived;
        {
            const MutexLock lock(mutex);
            if (ended) return false;
            arrived.swap(added);
        }
        files.remove_if([this](const auto& file) {
            const bool hasEnded = file->hasEnded();  // may change at any moment
            if (hasEnded) file->stop(notifications);
            return hasEnded;
        });
        for (const auto& file : arrived) {
            guarded(*file, [&] { file->start(notifications, now()); });
        }
        files.splice(files.end(), arrived);
        return true;
    }

    void waitForEvents() {
        const auto time = now();
        int timeout = -1;
        for (const auto& file : files) {
            const int left = millisecondsUntil(file->nextTime(), time);
            timeout = timeout < 0 ? left : std::min(timeout, left);
        }
        std::array<pollfd, 2> awaited{pollfd{bell.descriptor, POLLIN, 0},
                                      pollfd{notifications.descriptor(), POLLIN, 0}};
        ::poll(awaited.data(), awaited.size(), timeout);
    }

    template <class Action>
    void forEachFile(Action action) {
        for (const auto& file : files) {
            if (!file->hasEnded()) guarded(*file, [&] { action(*file); });
        }
    }

    // Memory may run out, and what is told of a change may throw: that is no reason to end.
    template <class Action>
    static void guarded(const WatchedFile& file, Action action) noexcept {
        try {
            try {
                action();
            } catch (const std::exception& error) {
                filesLogger.write(common::error,
                                  "Property file could not be followed: ", file.path().string(),
                                  ": ", error.what());
            }
        } catch (...) {
            // Nobody is left to tell.
        }
    }

    Mutex mutex;
    Files added VELKOR_GUARDED_BY(mutex);
    bool ended VELKOR_GUARDED_BY(mutex) = false;
    const Bell bell;

    // Of the thread alone.
    Inotify notifications;
    Files files;
};

std::shared_ptr<FileWatcher> FileWatcher::ofProcess() {
    static Mutex mutex;
    static std::weak_ptr<FileWatcher> current;
    const MutexLock lock(mutex);
    auto watcher = current.lock();
    if (watcher == nullptr) {
        watcher = std::make_shared<FileWatcher>();
        current = watcher;
    }
    return watcher;
}

FileWatcher::FileWatcher() : work(std::make_shared<Work>()) {
    thread.emplace([work = work] { work->run(); });
}

FileWatcher::~FileWatcher() {
    work->end();
}

void FileWatcher::add(std::shared_ptr<WatchedFile> file) {
    work->add(std::move(file));
}

void FileWatcher::remove(WatchedFile& file) noexcept {
    file.end();
    work->ring();
}

}  // namespace velkor::layers::detail
