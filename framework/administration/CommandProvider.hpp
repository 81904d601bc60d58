#pragma once

#include "framework/common/Export.hpp"

namespace velkor::administration {

/// Base of the objects that keep commands registered while they live.
class VELKOR_EXPORT CommandProvider {
public:
    virtual ~CommandProvider();
};

}  // namespace velkor::administration
