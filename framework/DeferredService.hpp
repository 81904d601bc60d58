#pragma once

#include "framework/common/Export.hpp"

namespace velkor {

/// Base of the objects that lend the host something for as long as they live.
class VELKOR_EXPORT DeferredService {
public:
    virtual ~DeferredService();
};

}  // namespace velkor
