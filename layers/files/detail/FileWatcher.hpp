#pragma once

#include <memory>
#include <optional>

#include "layers/OwnThread.hpp"
#include "layers/files/detail/WatchedFile.hpp"

namespace velkor::layers::detail {

/// The thread that looks after all files of the process, with one inotify instance for all. It
/// reads them and calls whom they belong to; it takes no signals of the process.
///
/// Thread-safe.
class FileWatcher {
public:
    /// The one of the process, which lives as long as somebody holds it. Throws `std::system_error`
    /// when the system refuses a thread or a descriptor.
    static std::shared_ptr<FileWatcher> ofProcess();

    /// One of its own. Throws as `ofProcess`.
    FileWatcher();

    /// Ends the thread, and waits for it unless it is the calling one. It may be reading a file; it
    /// is in no call of a file whose owner has let go of this.
    ~FileWatcher();

    FileWatcher(const FileWatcher&) = delete;
    FileWatcher& operator=(const FileWatcher&) = delete;

    /// Looks after `file` until it is ended. Doesn't wait.
    void add(std::shared_ptr<WatchedFile> file);

    /// Looks after `file` no more. Doesn't wait: it may be being read.
    void remove(WatchedFile& file) noexcept;

private:
    class Work;

    const std::shared_ptr<Work> work;
    std::optional<OwnThread> thread;  // empty only while this is being made
};

}  // namespace velkor::layers::detail
