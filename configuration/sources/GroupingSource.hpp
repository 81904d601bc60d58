#pragma once

#include "framework/common/Export.hpp"

namespace velkor::configuration {

/// What a `ConfigurationSource` implements beside it if its writes go on to where several can be
/// made as one, in a transaction for example.
class VELKOR_EXPORT GroupingSource {
public:
    virtual ~GroupingSource() = 0;

    /// Called before what one `apply` of the store writes to the source, and after it, on the
    /// thread that writes, with the mutex of the store held. Groups may be nested; the outermost
    /// counts. What an `apply` that fails takes back is written in the group as well. When
    /// `beginGroup` throws, its exception leaves `apply`, and nothing is written.
    virtual void beginGroup() = 0;
    virtual void endGroup() noexcept = 0;
};

}  // namespace velkor::configuration
