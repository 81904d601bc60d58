// Stands before the C library's functions of these names, for this program and the libraries that
// it uses.

#include "tests/layers/files/SystemHooks.hpp"

#include <fcntl.h>
#include <sys/inotify.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <cerrno>

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

}  // extern "C"
