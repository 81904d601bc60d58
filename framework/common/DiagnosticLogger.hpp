#pragma once

#include <atomic>
#include <functional>
#include <ostream>
#include <string>

#include "framework/common/Export.hpp"

namespace velkor::common {

/// How important a record is. The values are bits of the mask given to `DiagnosticLogger::enable`.
enum Severity : unsigned { fatal = 1, error = 2, warning = 4, debug = 8, trace = 16 };

/// Writes the diagnostic records of one channel to the Boost.Log core, with the attributes
/// "Channel" (`std::string`), "Severity" (`Severity`) and the composed "Message". Hosts attach the
/// sinks; as long as there is none, nothing is printed.
///
/// Thread-safe. A record of a disabled severity costs one relaxed load and a branch.
class VELKOR_EXPORT DiagnosticLogger {
public:
    /// A logger of `channel`. Loggers of the same channel share its enabled severities, which are
    /// fatal, error and warning until `enable` says otherwise.
    explicit DiagnosticLogger(std::string channel);
    ~DiagnosticLogger();

    DiagnosticLogger(const DiagnosticLogger&) = delete;
    DiagnosticLogger& operator=(const DiagnosticLogger&) = delete;

    /// Whether records of `severity` are written.
    bool isEnabled(Severity severity) const noexcept {
        return (enabled->load(std::memory_order_relaxed) & severity) != 0;
    }

    /// Writes one record whose message is `parts`, each inserted into a stream of the C locale in
    /// turn, truth values as 0 and 1. Composes nothing when the severity is disabled or no sink
    /// wants the record. What a sink throws passes on to the caller unless the host gave Boost.Log
    /// an exception handler. Lack of memory throws `std::bad_alloc`: no record is half of one.
    template <class... Parts>
    void write(Severity severity, const Parts&... parts) const {
        if (!isEnabled(severity)) return;
        const auto compose = [&](std::ostream& message) { (message << ... << parts); };
        push(severity, std::cref(compose));
    }

    /// Lets exactly the severities in the mask `severities` of `channel` be written, by all its
    /// loggers, those made later included. Other channels are not affected.
    static void enable(const std::string& channel, unsigned severities);

private:
    void push(Severity severity, const std::function<void(std::ostream&)>& compose) const;

    std::string channel;
    const std::atomic<unsigned>* enabled;
};

}  // namespace velkor::common
