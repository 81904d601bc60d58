#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "configuration/ConfigurationImpl.hpp"
#include "framework/common/Mutex.hpp"

namespace velkor::http::detail {

/// All keys of a store, sorted byte by byte, which are listed again only when the store has
/// changed: that takes a look at every key, and a client may ask for pages as often as it likes.
/// Thread-safe; the store is called under no lock.
class KeyList {
public:
    using Keys = std::vector<std::string>;

    /// The keys as they are now.
    std::shared_ptr<const Keys> of(configuration::ConfigurationImpl& store) VELKOR_EXCLUDES(mutex);

private:
    common::Mutex mutex;
    std::shared_ptr<const Keys> known VELKOR_GUARDED_BY(mutex);
    std::uint64_t version VELKOR_GUARDED_BY(mutex) = 0;
};

}  // namespace velkor::http::detail
