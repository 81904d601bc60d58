// Stands before the C library's functions of these names, for this program and the libraries that
// it uses.

#include "tests/layers/files/SystemHooks.hpp"

#include <fcntl.h>
#include <sys/inotify.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <cerrno>
#include <cstdarg>

using velkor::testing::SystemHooks;

extern "C" {

__attribute__((visibility("default"))) int inotify_init1(int flags) noexcept {
    if (const int error = SystemHooks::inotifyRefused) {
        errno = error;
        return -1;
    }
    return static_cast<int>(::syscall(SYS_inotify_init1, flags));
}

__attribute__((visibility("default"))) int inotify_add_watch(int instance, const char* path,
                                                             uint32_t mask) noexcept {
    if (const int error = SystemHooks::watchRefused) {
        errno = error;
        return -1;
    }
    return static_cast<int>(::syscall(SYS_inotify_add_watch, instance, path, mask));
}

__attribute__((visibility("default"))) int fstat(int descriptor, struct stat* status) noexcept {
    if (SystemHooks::beforeStatus) SystemHooks::beforeStatus();
    return ::fstatat(descriptor, "", status, AT_EMPTY_PATH);
}

__attribute__((visibility("default"))) int open(const char* path, int flags, ...) {
    va_list more;
    va_start(more, flags);
    const int mode = (flags & O_CREAT) != 0 ? va_arg(more, int) : 0;
    va_end(more);
    const int error = SystemHooks::accessRefused;
    if (error != 0 && (flags & O_NONBLOCK) != 0) {
        errno = error;
        return -1;
    }
    return static_cast<int>(::syscall(SYS_openat, AT_FDCWD, path, flags, mode));
}

__attribute__((visibility("default"))) int faccessat(int folder, const char* path, int mode,
                                                     int flags) noexcept {
    if (const int error = SystemHooks::accessRefused) {
        errno = error;
        return -1;
    }
    return static_cast<int>(::syscall(SYS_faccessat2, folder, path, mode, flags));
}

}  // extern "C"
