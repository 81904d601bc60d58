#pragma once

#include <functional>
#include <string>

namespace velkor::http::detail {

/// Who does what no connection is to wait for. Thread-safe.
class Jobs {
public:
    /// What is to be done; it throws nothing.
    using Job = std::function<void()>;

    enum class Kind { write, read };

    virtual ~Jobs() = default;

    /// Lets `job` of `owner` be done, at once or later, on any thread, or destroys it.
    virtual void post(Kind kind, const std::string& owner, Job job) = 0;

    /// Waits for the job that is being done, and destroys those that wait, as all that come
    /// afterwards. May be called several times, by one thread at a time, and not by a job.
    virtual void stop() noexcept = 0;
};

}  // namespace velkor::http::detail
