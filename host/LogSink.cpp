#include "host/LogSink.hpp"

#include <boost/core/null_deleter.hpp>
#include <boost/log/attributes/value_extraction.hpp>
#include <boost/log/core.hpp>
#include <boost/log/expressions/message.hpp>
#include <boost/log/sinks/sync_frontend.hpp>
#include <boost/log/sinks/text_ostream_backend.hpp>
#include <boost/log/utility/formatting_ostream.hpp>
#include <boost/smart_ptr/make_shared.hpp>
#include <string>
#include <utility>

#include "framework/common/DiagnosticLogger.hpp"
#include "host/Severities.hpp"
#include "host/TerminalText.hpp"

namespace velkor::host {

namespace {

namespace logging = boost::log;

using Backend = logging::sinks::text_ostream_backend;
using Sink = logging::sinks::synchronous_sink<Backend>;

void formatRecord(const logging::record_view& record, logging::formatting_ostream& out) {
    const auto severity = logging::extract<common::Severity>("Severity", record);
    const auto channel = logging::extract<std::string>("Channel", record);
    const auto message = logging::extract<std::string>("Message", record);
    if (severity) out << severityName(*severity) << ' ';
    if (channel) out << *channel << ": ";
    if (message) out << escapedForTerminal(*message, LineFeeds::escaped);
}

boost::shared_ptr<Sink> makeSink(std::ostream& out) {
    const auto backend = boost::make_shared<Backend>();
    backend->add_stream(boost::shared_ptr<std::ostream>(&out, boost::null_deleter()));
    backend->auto_flush(true);
    auto sink = boost::make_shared<Sink>(backend);
    sink->set_formatter(&formatRecord);
    return sink;
}

}  // namespace

class LogSink::Attachment {
public:
    explicit Attachment(std::ostream& out) : sink(makeSink(out)) {
        logging::core::get()->add_sink(sink);
    }
    ~Attachment() { logging::core::get()->remove_sink(sink); }

    Attachment(const Attachment&) = delete;
    Attachment& operator=(const Attachment&) = delete;

private:
    boost::shared_ptr<Sink> sink;
};

LogSink::LogSink(std::ostream& out) : attachment(std::make_unique<Attachment>(out)) {}

LogSink::~LogSink() = default;

}  // namespace velkor::host
