#include "tests/layers/faults/SimulatedFile.hpp"

#include <algorithm>

namespace velkor::testing {

std::size_t SimulatedFile::read(std::size_t offset, unsigned char* target,
                                std::size_t count) const {
    if (offset >= written.size()) return 0;
    const std::size_t available = std::min(count, written.size() - offset);
    std::copy_n(written.data() + offset, available, target);
    return available;
}

void SimulatedFile::write(std::size_t offset, const unsigned char* bytes, std::size_t count) {
    if (count == 0) return;
    if (written.size() < offset + count) resize(offset + count);
    std::copy_n(bytes, count, written.data() + offset);
    const std::size_t last = (offset + count - 1) / sectorSize;
    for (std::size_t index = offset / sectorSize; index <= last; ++index) {
        versions[index].push_back(sectorOf(written, index));
        unsyncable.erase(index);
    }
}

void SimulatedFile::resize(std::size_t newSize) {
    written.resize(newSize);
    sizes.push_back(newSize);
}

void SimulatedFile::sync() {
    durable.resize(written.size());
    for (auto version = versions.begin(); version != versions.end();) {
        if (unsyncable.count(version->first) > 0) {
            ++version;
            continue;
        }
        store(durable, version->first, sectorOf(written, version->first));
        version = versions.erase(version);
    }
    sizes.clear();
}

void SimulatedFile::failToSync() {
    for (const auto& version : versions) unsyncable.insert(version.first);
}

void SimulatedFile::losePower(unsigned lost, Random& random) {
    const auto loses = [&] { return below(100, random) < lost; };
    written = durable;
    if (!sizes.empty() && !loses()) {
        written.resize(loses() ? sizes[below(sizes.size(), random)] : sizes.back());
    }
    for (const auto& [index, sectors] : versions) {
        if (loses()) continue;
        store(written, index, loses() ? sectors[below(sectors.size(), random)] : sectors.back());
    }
    versions.clear();
    unsyncable.clear();
    sizes.clear();
    durable = written;
}

SimulatedFile::Sector SimulatedFile::sectorOf(const std::vector<unsigned char>& content,
                                              std::size_t index) {
    Sector sector{};
    const std::size_t begin = index * sectorSize;
    if (begin < content.size()) {
        std::copy_n(content.data() + begin, std::min(sectorSize, content.size() - begin),
                    sector.data());
    }
    return sector;
}

void SimulatedFile::store(std::vector<unsigned char>& content, std::size_t index,
                          const Sector& sector) {
    const std::size_t begin = index * sectorSize;
    if (begin >= content.size()) return;
    std::copy_n(sector.data(), std::min(sectorSize, content.size() - begin),
                content.data() + begin);
}

}  // namespace velkor::testing
