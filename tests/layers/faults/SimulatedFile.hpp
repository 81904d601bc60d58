#pragma once

#include <array>
#include <cstddef>
#include <map>
#include <random>
#include <set>
#include <vector>

namespace velkor::testing {

using Random = std::mt19937_64;

/// A number below `limit`, which is not 0.
inline std::size_t below(std::size_t limit, Random& random) {
    return static_cast<std::size_t>(random() % limit);
}

/// The content of one file on a disk that may lose what was not synced. What was written since the
/// last sync is known sector by sector, in every version that a sector had. Not thread-safe.
class SimulatedFile {
public:
    static constexpr std::size_t sectorSize = 512;

    std::size_t size() const { return written.size(); }

    /// Reads up to `count` bytes from `offset` on and gives their number.
    std::size_t read(std::size_t offset, unsigned char* target, std::size_t count) const;

    void write(std::size_t offset, const unsigned char* bytes, std::size_t count);

    /// Cuts the content to `newSize` bytes, or extends it by zeros.
    void resize(std::size_t newSize);

    /// Lets what was written last survive power cuts.
    void sync();

    /// A sync that fails: what was written by now is no surer after the next one either, but for
    /// the sectors that are written again.
    void failToSync();

    /// A power cut: leaves the file with one of the sizes and each sector with one of the versions
    /// that it had since the last sync. An older version is left with a chance of `lost` percent.
    void losePower(unsigned lost, Random& random);

private:
    using Sector = std::array<unsigned char, sectorSize>;

    /// The sector `index` of `content`, with zeros for what is behind its end.
    static Sector sectorOf(const std::vector<unsigned char>& content, std::size_t index);
    static void store(std::vector<unsigned char>& content, std::size_t index, const Sector& sector);

    std::vector<unsigned char> written;                   ///< What a reader sees.
    std::vector<unsigned char> durable;                   ///< As of the last sync.
    std::map<std::size_t, std::vector<Sector>> versions;  ///< Of the sectors written since.
    std::set<std::size_t> unsyncable;                     ///< Sectors that no sync reaches.
    std::vector<std::size_t> sizes;                       ///< That the file had since.
};

}  // namespace velkor::testing
