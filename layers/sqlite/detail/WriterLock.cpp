#include "layers/sqlite/detail/WriterLock.hpp"

#include <array>
#include <cerrno>
#include <cstddef>
#include <stdexcept>
#include <system_error>

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

namespace velkor::layers::detail {

WriterLock::WriterLock(const std::filesystem::path& file, const std::string& holder)
    : path(file.string() + ".lock") {
    try {
        while (!take()) {
        }
        write(std::to_string(::getpid()) + " (" + holder + ")");
    } catch (...) {
        if (descriptor >= 0) ::close(descriptor);
        throw;
    }
}

WriterLock::~WriterLock() {
    // Removed first: whoever has opened it meanwhile finds, with the lock, that it has gone.
    ::unlink(path.c_str());
    ::close(descriptor);
}

// Takes the lock; false when the file was removed meanwhile by the one that held it before.
bool WriterLock::take() {
    descriptor = ::open(path.c_str(), O_RDWR | O_CREAT | O_CLOEXEC, 0644);
    if (descriptor < 0) fail();
    // Not a lock of the process on a range: these would end with any other use of the file in it.
    if (::flock(descriptor, LOCK_EX | LOCK_NB) != 0) {
        if (errno != EWOULDBLOCK) fail();
        const std::string holder = read();
        throw std::runtime_error((holder.empty() ? "another process" : "process " + holder) +
                                 " writes it");
    }
    if (isStillThere()) return true;
    ::close(descriptor);
    descriptor = -1;
    return false;
}

bool WriterLock::isStillThere() const {
    struct stat locked {};
    struct stat named {};
    if (::fstat(descriptor, &locked) != 0) fail();
    if (::stat(path.c_str(), &named) != 0) return false;
    return locked.st_dev == named.st_dev && locked.st_ino == named.st_ino;
}

// Who holds the lock is told as well as possible: on a full disk it isn't.
void WriterLock::write(const std::string& holder) const {
    if (::ftruncate(descriptor, 0) != 0) return;
    static_cast<void>(::pwrite(descriptor, holder.data(), holder.size(), 0));
}

std::string WriterLock::read() const {
    std::array<char, 256> text{};
    const auto size = ::pread(descriptor, text.data(), text.size(), 0);
    return size > 0 ? std::string(text.data(), static_cast<std::size_t>(size)) : std::string();
}

void WriterLock::fail() const {
    const int reason = errno;
    throw std::runtime_error("its lock can't be taken: " + path.string() + ": " +
                             std::generic_category().message(reason));
}

}  // namespace velkor::layers::detail
