#pragma once

#include <filesystem>
#include <string>

namespace velkor::layers::detail {

/// The right to write one file, which one holder at a time has among all processes of the machine,
/// and within one. It is a lock on a file beside the other one, named as it with ".lock" behind,
/// which says who holds it and is removed at the end. A holder that was killed holds it no more.
class WriterLock {
public:
    /// Takes the right to write `file` in the name of `holder`. Throws `std::runtime_error`
    /// "process 4711 (its name) writes it", "another process writes it" when that one hasn't said
    /// yet who it is, or "its lock can't be taken: ", the path and the system's reason.
    WriterLock(const std::filesystem::path& file, const std::string& holder);
    ~WriterLock();

    WriterLock(const WriterLock&) = delete;
    WriterLock& operator=(const WriterLock&) = delete;

private:
    bool take();
    bool isStillThere() const;
    void write(const std::string& holder) const;
    std::string read() const;
    [[noreturn]] void fail() const;

    std::filesystem::path path;
    int descriptor = -1;
};

}  // namespace velkor::layers::detail
