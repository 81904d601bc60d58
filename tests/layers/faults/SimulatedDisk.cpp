#include "tests/layers/faults/SimulatedDisk.hpp"

#include <array>
#include <set>
#include <utility>

namespace velkor::testing {

namespace {

bool changesTheDisk(DiskOperation operation) {
    return operation != DiskOperation::open && operation != DiskOperation::read;
}

bool isHeldUp(DiskOperation operation) {
    return operation == DiskOperation::write || operation == DiskOperation::sync;
}

}  // namespace

DiskAnswer SimulatedDisk::open(const std::string& name, bool mayCreate, OpenFile& opened) {
    std::unique_lock<std::mutex> lock(mutex);
    const DiskAnswer answer = admit(lock, DiskOperation::open, session);
    if (answer != DiskAnswer::done) return answer;
    const auto found = names.find(name);
    if (found != names.end()) {
        opened = {found->second, session};
        return DiskAnswer::done;
    }
    if (!mayCreate) return DiskAnswer::failed;
    opened = {std::make_shared<SimulatedFile>(), session};
    if (!name.empty()) names.emplace(name, opened.file);
    return DiskAnswer::done;
}

SimulatedDisk::ReadAnswer SimulatedDisk::read(const OpenFile& from, std::size_t offset,
                                              unsigned char* target, std::size_t count) {
    std::unique_lock<std::mutex> lock(mutex);
    const DiskAnswer answer = admit(lock, DiskOperation::read, from.session);
    if (answer != DiskAnswer::done) return {answer, 0};
    return {answer, from.file->read(offset, target, count)};
}

DiskAnswer SimulatedDisk::write(const OpenFile& to, std::size_t offset, const unsigned char* bytes,
                                std::size_t count) {
    std::unique_lock<std::mutex> lock(mutex);
    const DiskAnswer answer = admit(lock, DiskOperation::write, to.session);
    if (answer == DiskAnswer::done) to.file->write(offset, bytes, count);
    if (answer == DiskAnswer::partlyDone) to.file->write(offset, bytes, count / 2);
    return answer;
}

DiskAnswer SimulatedDisk::resize(const OpenFile& which, std::size_t size) {
    std::unique_lock<std::mutex> lock(mutex);
    const DiskAnswer answer = admit(lock, DiskOperation::resize, which.session);
    if (answer == DiskAnswer::done) which.file->resize(size);
    return answer;
}

DiskAnswer SimulatedDisk::sync(OpenFile& which) {
    std::unique_lock<std::mutex> lock(mutex);
    const DiskAnswer answer = admit(lock, DiskOperation::sync, which.session);
    if (answer != DiskAnswer::done) {
        if (isPowered && which.session == session) which.file->failToSync();
        return answer;
    }
    which.file->sync();
    if (std::exchange(which.syncsFolder, false)) durableNames = names;
    return answer;
}

DiskAnswer SimulatedDisk::remove(const std::string& name, bool syncsFolder) {
    std::unique_lock<std::mutex> lock(mutex);
    const DiskAnswer answer = admit(lock, DiskOperation::remove, session);
    if (answer != DiskAnswer::done) return answer;
    names.erase(name);
    if (syncsFolder) durableNames = names;
    return answer;
}

std::size_t SimulatedDisk::size(const OpenFile& which) const {
    const std::lock_guard<std::mutex> lock(mutex);
    return which.file->size();
}

bool SimulatedDisk::has(const std::string& name) const {
    const std::lock_guard<std::mutex> lock(mutex);
    return names.count(name) > 0;
}

bool SimulatedDisk::isCurrent(const OpenFile& file) const {
    const std::lock_guard<std::mutex> lock(mutex);
    return isPowered && file.session == session;
}

void SimulatedDisk::fail(const DiskFault& newFault) {
    const std::lock_guard<std::mutex> lock(mutex);
    fault = newFault;
    hasFailed = false;
}

bool SimulatedDisk::recover() {
    const std::lock_guard<std::mutex> lock(mutex);
    fault.reset();
    return std::exchange(hasFailed, false);
}

void SimulatedDisk::cutPowerAfter(std::size_t operations) {
    const std::lock_guard<std::mutex> lock(mutex);
    usesLeft = operations;
}

bool SimulatedDisk::hasPower() const {
    const std::lock_guard<std::mutex> lock(mutex);
    return isPowered;
}

void SimulatedDisk::restartAfterPowerCut(Random& random) {
    static constexpr std::array<unsigned, 5> chances{0, 10, 50, 90, 100};
    const auto chance = [&random] { return chances[below(chances.size(), random)]; };
    const std::lock_guard<std::mutex> lock(mutex);
    start();
    const unsigned lostNames = chance();
    std::set<std::string> unsure;
    for (const auto& entry : names) unsure.insert(entry.first);
    for (const auto& entry : durableNames) unsure.insert(entry.first);
    Names left;
    for (const std::string& name : unsure) {
        const Names& version = below(100, random) < lostNames ? durableNames : names;
        const auto entry = version.find(name);
        if (entry == version.end()) continue;
        const auto file = std::make_shared<SimulatedFile>(*entry->second);
        file->losePower(chance(), random);
        left.emplace(name, file);
    }
    durableNames = left;
    names = std::move(left);
}

void SimulatedDisk::restartAfterKill() {
    const std::lock_guard<std::mutex> lock(mutex);
    start();
}

void SimulatedDisk::hold() {
    const std::lock_guard<std::mutex> lock(mutex);
    isHolding = true;
}

void SimulatedDisk::waitUntilHolding() {
    std::unique_lock<std::mutex> lock(mutex);
    heldUp.wait(lock, [this] { return waiting > 0 || !isPowered; });
}

void SimulatedDisk::letGo() {
    const std::lock_guard<std::mutex> lock(mutex);
    isHolding = false;
    goesOn.notify_all();
}

DiskAnswer SimulatedDisk::admit(std::unique_lock<std::mutex>& lock, DiskOperation operation,
                                unsigned caller) {
    if (isHolding && isHeldUp(operation)) {
        ++waiting;
        heldUp.notify_all();
        goesOn.wait(lock, [this] { return !isHolding; });
        --waiting;
    }
    if (changesTheDisk(operation) && loseOneUse()) losePower();
    if (!isPowered || caller != session) return DiskAnswer::failed;
    if (!fault || fault->operation != operation) return DiskAnswer::done;
    if (fault->successes > 0) {
        --fault->successes;
        return DiskAnswer::done;
    }
    const DiskAnswer answer = fault->answer;
    hasFailed = true;
    if (!fault->isLasting) fault.reset();
    return answer;
}

/// Whether the power ends with the operation that is about to be done.
bool SimulatedDisk::loseOneUse() {
    if (!usesLeft) return false;
    if (*usesLeft == 0) return true;
    --*usesLeft;
    return false;
}

void SimulatedDisk::losePower() {
    isPowered = false;
    heldUp.notify_all();
}

void SimulatedDisk::start() {
    ++session;
    isPowered = true;
    usesLeft.reset();
}

}  // namespace velkor::testing
