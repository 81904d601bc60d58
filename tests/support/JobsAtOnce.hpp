#pragma once

#include <string>

#include "http/detail/routes/Jobs.hpp"

namespace velkor::testing {

/// Does every job where it is posted: a service with these has no thread.
class JobsAtOnce final : public http::detail::Jobs {
public:
    void post(Kind /*kind*/, const std::string& /*owner*/, Job job) override { job(); }
    void stop() noexcept override {}
};

}  // namespace velkor::testing
