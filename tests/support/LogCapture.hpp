#pragma once

#include <boost/log/attributes/value_extraction.hpp>
#include <boost/log/attributes/value_visitation.hpp>
#include <boost/log/core.hpp>
#include <boost/log/core/record_view.hpp>
#include <boost/log/sinks/sink.hpp>
#include <boost/log/utility/formatting_ostream.hpp>
#include <boost/smart_ptr/make_shared.hpp>
#include <boost/smart_ptr/shared_ptr.hpp>
#include <functional>
#include <mutex>
#include <string>
#include <utility>
#include <vector>

#include "framework/common/DiagnosticLogger.hpp"

namespace velkor::testing {

/// One diagnostic record as a sink received it.
struct LogRecord {
    std::string channel;
    common::Severity severity;
    std::string message;
};

/// The mask of all severities.
inline constexpr unsigned everySeverity =
    common::fatal | common::error | common::warning | common::debug | common::trace;

/// Collects the records of one channel while it lives, and meanwhile enables the given severities
/// of that channel; afterwards they are what they were. Thread-safe. Programs that use it link
/// Boost::log.
class LogCapture {
public:
    explicit LogCapture(std::string channelName, unsigned severities = everySeverity)
        : channel(std::move(channelName)),
          severitiesBefore(enabledSeverities(channel)),
          sink(boost::make_shared<Sink>(channel)) {
        boost::log::core::get()->add_sink(sink);
        common::DiagnosticLogger::enable(channel, severities);
    }

    ~LogCapture() {
        common::DiagnosticLogger::enable(channel, severitiesBefore);
        boost::log::core::get()->remove_sink(sink);
    }

    LogCapture(const LogCapture&) = delete;
    LogCapture& operator=(const LogCapture&) = delete;

    /// The records so far, oldest first.
    std::vector<LogRecord> records() const { return sink->records(); }

    /// Runs `action` inside the sink for each record from now on. Not while others write records.
    void whenRecorded(std::function<void(const LogRecord&)> action) {
        sink->whenRecorded = std::move(action);
    }

    /// Only the messages of the records so far.
    std::vector<std::string> messages() const {
        std::vector<std::string> texts;
        for (LogRecord& record : sink->records()) texts.push_back(std::move(record.message));
        return texts;
    }

    /// The mask of the severities that `channelName` writes.
    static unsigned enabledSeverities(const std::string& channelName) {
        const common::DiagnosticLogger logger(channelName);
        unsigned mask = 0;
        for (const auto severity :
             {common::fatal, common::error, common::warning, common::debug, common::trace}) {
            if (logger.isEnabled(severity)) mask |= severity;
        }
        return mask;
    }

private:
    class Sink final : public boost::log::sinks::sink {
    public:
        explicit Sink(std::string channelName) : sink(false), channel(std::move(channelName)) {}

        bool will_consume(const boost::log::attribute_value_set& attributes) override {
            const auto found = boost::log::extract<std::string>("Channel", attributes);
            return found && found.get() == channel;
        }

        void consume(const boost::log::record_view& record) override {
            const auto severity = boost::log::extract<common::Severity>("Severity", record);
            const auto message = boost::log::extract<std::string>("Message", record);
            const LogRecord collectedRecord{channel, severity.get(), message.get()};
            {
                const std::lock_guard<std::mutex> lock(mutex);
                collected.push_back(collectedRecord);
            }
            if (whenRecorded) whenRecorded(collectedRecord);
        }

        void flush() override {}

        std::vector<LogRecord> records() const {
            const std::lock_guard<std::mutex> lock(mutex);
            return collected;
        }

        std::function<void(const LogRecord&)> whenRecorded;

    private:
        const std::string channel;
        mutable std::mutex mutex;
        std::vector<LogRecord> collected;  // guarded by mutex
    };

    const std::string channel;
    const unsigned severitiesBefore;
    const boost::shared_ptr<Sink> sink;
};

}  // namespace velkor::testing
