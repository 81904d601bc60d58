#include "layers/files/ReloadingFileSource.hpp"

#include <cstddef>
#include <stdexcept>
#include <utility>

#include "configuration/StoreErrors.hpp"
#include "configuration/sources/PropertyFileSource.hpp"
#include "framework/common/Mutex.hpp"
#include "layers/OwnThread.hpp"
#include "layers/detail/TableChange.hpp"
#include "layers/files/Loggers.hpp"
#include "layers/files/detail/FileReading.hpp"
#include "layers/files/detail/FileWatcher.hpp"
#include "layers/files/detail/WatchedFile.hpp"

namespace velkor::layers {

using common::Mutex;
using common::MutexLock;
using configuration::ConfigurationValue;
using configuration::PropertyFileSource;
using configuration::ValueMap;
using configuration::ValueTable;
using detail::FileReading;
using detail::Look;
using std::chrono::system_clock;

namespace {

constexpr const char* writingNotSupported = "ReloadingFileSource does not support writing";
constexpr const char* noInterval = "A file has to be looked at in intervals.";

ValueMap propertiesOf(const FileReading& reading) {
    ValueMap properties;
    if (!reading.problem.empty()) return properties;
    PropertyFileSource parsed(configuration::PropertyText{reading.text});
    for (const auto& key : parsed.keys()) properties.emplace(key, parsed.get(key));
    return properties;
}

}  // namespace

// The file of a source, and what is known of it.
class ReloadingFileSource::File {
public:
    File(const std::filesystem::path& path, const ReloadingFileOptions& given);

    FileStatus status() const VELKOR_EXCLUDES(mutex) {
        const MutexLock lock(mutex);
        return current;
    }

    void follow(const std::shared_ptr<ReloadingFileSource>& source) VELKOR_EXCLUDES(mutex);
    void leave() noexcept VELKOR_EXCLUDES(mutex);

    // Of the thread that follows the file, which alone changes the values.
    Look take(ReloadingFileSource& source, const FileReading& reading, ValueMap&& properties);

    const std::filesystem::path place;
    const ReloadingFileOptions options;
    ValueMap initial;

private:
    static std::optional<Look> reload(const std::weak_ptr<ReloadingFileSource>& source,
                                      const std::filesystem::path& path, std::uintmax_t mostBytes);
    std::string problemOf(const FileReading& reading) const;
    void note(const Look& look, const std::string& problem) VELKOR_EXCLUDES(mutex);
    void say(const std::string& problem) VELKOR_EXCLUDES(mutex);

    // Held as long as the source lives: letting go of it may mean to wait for its thread.
    std::shared_ptr<detail::FileWatcher> watcher;
    std::size_t size;         // of the table
    bool hadContent = false;  // when it was good last

    mutable Mutex mutex;
    FileStatus current VELKOR_GUARDED_BY(mutex);
    Look last VELKOR_GUARDED_BY(mutex);
    std::shared_ptr<detail::WatchedFile> watched VELKOR_GUARDED_BY(mutex);
};

ReloadingFileSource::File::File(const std::filesystem::path& path,
                                const ReloadingFileOptions& given)
    : place(std::filesystem::absolute(path)), options(given) {
    if (options.lookEvery <= std::chrono::milliseconds::zero()) {
        throw std::invalid_argument(noInterval);
    }
    const FileReading reading = detail::readFile(place, options.mostBytes);
    if (options.mustBeReadable && !reading.problem.empty()) {
        throw std::runtime_error(reading.wasOpened
                                     ? reading.problem
                                     : configuration::store_errors::fileNotOpened + place.string());
    }
    initial = propertiesOf(reading);
    size = initial.size();
    hadContent = !reading.text.empty();
    say(reading.problem);
    note({reading.identity, reading.problem.empty()}, reading.problem);
    watcher = detail::FileWatcher::ofProcess();
}

void ReloadingFileSource::File::follow(const std::shared_ptr<ReloadingFileSource>& source) {
    std::shared_ptr<detail::WatchedFile> toFollow;
    {
        const MutexLock lock(mutex);
        auto reading = [weak = std::weak_ptr<ReloadingFileSource>(source), path = place,
                        mostBytes = options.mostBytes] { return reload(weak, path, mostBytes); };
        watched = std::make_shared<detail::WatchedFile>(place, options.lookEvery, last,
                                                        std::move(reading));
        toFollow = watched;
    }
    watcher->add(std::move(toFollow));
}

void ReloadingFileSource::File::leave() noexcept {
    const MutexLock lock(mutex);
    if (watched != nullptr) watcher->remove(*watched);
    watched.reset();
}

// The source is not held while the file is read, so that its end doesn't wait behind a slow disk on
// this thread.
std::optional<Look> ReloadingFileSource::File::reload(
    const std::weak_ptr<ReloadingFileSource>& source, const std::filesystem::path& path,
    std::uintmax_t mostBytes) {
    const FileReading reading = detail::readFile(path, mostBytes);
    if (reading.torn) return std::nullopt;
    ValueMap properties = propertiesOf(reading);
    const OwnThread::Borrowing waitedFor;
    const auto living = source.lock();
    if (living == nullptr) return Look{reading.identity, true};
    return living->file->take(*living, reading, std::move(properties));
}

Look ReloadingFileSource::File::take(ReloadingFileSource& source, const FileReading& reading,
                                     ValueMap&& properties) {
    const std::string problem = problemOf(reading);
    const Look look{reading.identity, problem.empty()};
    say(problem);
    if (look.isGood) hadContent = !reading.text.empty();
    if (!look.isGood && !options.forgetsUnreadable) {
        note(look, problem);
        return look;
    }
    detail::TableChange change(source.values, size, std::move(properties));
    if (change.isEmpty()) {
        note(look, problem);
        return look;
    }
    size = change.sizeAfter();
    source.change([&](ValueTable& table) {
        auto keys = change.applyTo(table);
        note(look, problem);
        return keys;
    });
    return look;
}

std::string ReloadingFileSource::File::problemOf(const FileReading& reading) const {
    const bool isEmptied = reading.problem.empty() && reading.text.empty() && hadContent;
    return isEmptied ? "Property file is empty: " + place.string() : reading.problem;
}

void ReloadingFileSource::File::note(const Look& look, const std::string& problem) {
    const auto now = system_clock::now();
    const MutexLock lock(mutex);
    last = look;
    if (problem.empty()) {
        current = {now, std::nullopt};
    } else {
        current.problem = {problem, current.problem ? current.problem->since : now};
    }
}

// Once for each change of what is wrong.
void ReloadingFileSource::File::say(const std::string& problem) {
    const auto before = status().problem;
    if (problem == (before ? before->text : "")) return;
    if (problem.empty()) {
        filesLogger.write(common::warning, "Property file is read again: ", place.string());
    } else {
        filesLogger.write(common::warning, problem);
    }
}

ReloadingFileSource::ReloadingFileSource(const std::filesystem::path& path,
                                         const ReloadingFileOptions& options)
    : ReloadingFileSource(std::make_unique<File>(path, options)) {}

ReloadingFileSource::ReloadingFileSource(std::unique_ptr<File> read)
    : LiveSource(typeid(ReloadingFileSource), std::move(read->initial), Code::own),
      file(std::move(read)) {}

ReloadingFileSource::~ReloadingFileSource() {
    file->leave();
}

ConfigurationValue ReloadingFileSource::set(const std::string&, ConfigurationValue) {
    throw std::runtime_error(writingNotSupported);
}

FileStatus ReloadingFileSource::status() const {
    return file->status();
}

configuration::SourceState ReloadingFileSource::state() const {
    auto [loaded, problem] = status();
    configuration::SourceState state;
    state.isWell = !problem;
    state.updated = loaded;
    if (problem) {
        state.since = problem->since;
        state.lastError = std::move(problem->text);
    }
    return state;
}

const std::filesystem::path& ReloadingFileSource::path() const noexcept {
    return file->place;
}

void ReloadingFileSource::started() {
    file->follow(shared_from_this());
}

void ReloadingFileSource::stopped() noexcept {
    file->leave();
}

}  // namespace velkor::layers
