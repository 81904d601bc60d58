#pragma once

#include "framework/Future.hpp"
#include "framework/common/Export.hpp"

namespace velkor::configuration {

/// What a `ConfigurationSource` implements beside it if what is written to it reaches its readers
/// before it reaches a disk or another machine. Whoever acknowledges a write waits for it.
class VELKOR_EXPORT DurableSource {
public:
    virtual ~DurableSource() = 0;

    /// Resolves with true when all writes that were accepted before this call are where they last.
    /// Fails with the reason when one of them is not. Called from any thread, without the mutex of
    /// the store where the answer is waited for.
    virtual Future<bool> committed() = 0;
};

}  // namespace velkor::configuration
