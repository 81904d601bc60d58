#pragma once

#include <memory>
#include <ostream>

namespace velkor::host {

/// Writes every diagnostic record of the process to a stream while it lives: one line
/// "SEVERITY CHANNEL: MESSAGE" each, control characters escaped, written at once.
/// Thread-safe; `out` must live as long.
class LogSink {
public:
    explicit LogSink(std::ostream& out);
    ~LogSink();

    LogSink(const LogSink&) = delete;
    LogSink& operator=(const LogSink&) = delete;

private:
    class Attachment;
    std::unique_ptr<Attachment> attachment;
};

}  // namespace velkor::host
