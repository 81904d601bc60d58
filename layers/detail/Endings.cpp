#include "layers/detail/Endings.hpp"

namespace velkor::layers::detail {

using common::MutexLock;

namespace {

Endings allEndings;

}  // namespace

Endings& Endings::ofAll() {
    return allEndings;
}

Endings::~Endings() {
    MutexLock lock(mutex);
    while (count > 0) lock.wait(removed);
}

void Endings::add() {
    const MutexLock lock(mutex);
    ++count;
}

void Endings::remove() {
    const MutexLock lock(mutex);
    --count;
    removed.notify_all();
}

}  // namespace velkor::layers::detail
