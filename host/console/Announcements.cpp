#include "host/console/Announcements.hpp"

#include <sys/eventfd.h>
#include <unistd.h>

#include <cerrno>
#include <system_error>

namespace velkor::host {

namespace {

int makeEvent() {
    const int event = ::eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK);
    if (event < 0) throw std::system_error(errno, std::generic_category(), "eventfd");
    return event;
}

}  // namespace

Announcements::Announcements(Output& shownIn) : event(makeEvent()), output(&shownIn) {}

Announcements::~Announcements() {
    ::close(event);
}

void Announcements::announce(const std::string& text) {
    const common::MutexLock lock(mutex);
    if (output == nullptr) return;
    if (!editing) return output->answer(text, paintOption);
    pending.push_back(text);
    ::eventfd_write(event, 1);
}

void Announcements::close() {
    const common::MutexLock lock(mutex);
    output = nullptr;
    pending.clear();
}

void Announcements::beginEditing() {
    const common::MutexLock lock(mutex);
    editing = true;
}

void Announcements::endEditing() {
    const common::MutexLock lock(mutex);
    editing = false;
    showPending();
}

void Announcements::show() {
    const common::MutexLock lock(mutex);
    showPending();
}

void Announcements::showPending() {
    eventfd_t count = 0;
    ::eventfd_read(event, &count);
    for (const auto& text : pending) output->answer(text, paintOption);
    pending.clear();
}

}  // namespace velkor::host
