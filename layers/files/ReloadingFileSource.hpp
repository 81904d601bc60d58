#pragma once

#include <chrono>
#include <cstdint>
#include <filesystem>
#include <memory>
#include <optional>
#include <string>

#include "configuration/ConfigurationValue.hpp"
#include "configuration/sources/MonitoredSource.hpp"
#include "framework/common/Export.hpp"
#include "layers/LiveSource.hpp"

namespace velkor::layers {

/// How a file is followed.
struct ReloadingFileOptions {
    static constexpr std::uintmax_t usualBytes = std::uintmax_t{256} << 20U;

    /// Construction throws when the file can't be read. Otherwise the source begins without values
    /// then, and takes those of the file once it can.
    bool mustBeReadable = true;

    /// What the source does while the file can't be read: forgets the values that it has from it,
    /// or keeps them.
    bool forgetsUnreadable = false;

    /// The largest file that is read, in bytes; a larger one can't be.
    std::uintmax_t mostBytes = usualBytes;

    /// How often the source looks at the file itself, in case that the system does not tell of
    /// changes. More than zero.
    std::chrono::milliseconds lookEvery{2000};
};

/// How a followed file stands.
struct FileStatus {
    /// What is wrong with the file, and since when anything is.
    struct Problem {
        std::string text;  ///< With the path; see `ReloadingFileSource`.
        std::chrono::system_clock::time_point since;
    };

    /// When the file was read last; nothing if never.
    std::optional<std::chrono::system_clock::time_point> loaded{};
    std::optional<Problem> problem{};
};

/// A read-only layer that holds the properties of one file, and reads it again when it changes.
/// Made by `std::make_shared`.
///
/// While it is registered in a store the file is followed: written in place or replaced, over links
/// and folders that are replaced, removed and made again, in a folder that isn't there yet. What is
/// done to it in one go is read once, when nothing has happened for 50 ms, and at most 1 s later.
/// All keys that have another value then, new and removed ones included, change together; the
/// others are not touched. A file that is changed in place is read when it is closed: what
/// somebody writes in several goes, half of it can't be told from the whole. To be sure, write
/// another file and rename it.
///
/// A file that can't be read leaves the values as they are, unless the options say otherwise. That
/// and its end stand in `status`, and in the log as warnings of the channel "velkor::files":
/// - "Property file could not be opened: PATH: REASON", REASON being the system's, or "Not a
/// regular
///   file";
/// - "Property file could not be read: PATH: REASON";
/// - "Property file is larger than N bytes: PATH";
/// - "Property file is empty: PATH", for one that had a content before.
///
/// All such files of a process are followed by one thread, which lives while there are any.
/// Watchers are called on it: what they wait for, all the files do. Reading doesn't wait for files.
class VELKOR_EXPORT ReloadingFileSource final
    : public LiveSource,
      public configuration::MonitoredSource,
      public std::enable_shared_from_this<ReloadingFileSource> {
public:
    /// Reads the file at `path`, which stands for the same place from now on if it is relative.
    /// Throws, if the file must be readable, `std::runtime_error` "Property file could not be
    /// opened: PATH", or one of the other texts above. Throws `std::invalid_argument` "A file has
    /// to be looked at in intervals." for an interval that is not positive, and `std::system_error`
    /// when the system refuses a thread or a descriptor.
    explicit ReloadingFileSource(const std::filesystem::path& path,
                                 const ReloadingFileOptions& options = {});

    /// Ends the thread if this is the last such source, and waits for it, at most until it has read
    /// a file; not on the thread itself.
    ~ReloadingFileSource() override;

    /// Throws `std::runtime_error` "ReloadingFileSource does not support writing".
    configuration::ConfigurationValue set(const std::string& key,
                                          configuration::ConfigurationValue value) override;

    /// From any thread.
    FileStatus status() const;

    /// `status` as of any source: well while there is no problem.
    configuration::SourceState state() const override;

    /// The absolute path.
    const std::filesystem::path& path() const noexcept;

private:
    class File;

    explicit ReloadingFileSource(std::unique_ptr<File> read);

    void started() override;
    void stopped() noexcept override;

    const std::unique_ptr<File> file;
};

}  // namespace velkor::layers
