#include "framework/common/DiagnosticLogger.hpp"

#include <boost/log/attributes/attribute_set.hpp>
#include <boost/log/attributes/constant.hpp>
#include <boost/log/core.hpp>
#include <boost/log/sinks/sink.hpp>
#include <boost/log/sources/record_ostream.hpp>
#include <boost/log/utility/formatting_ostream.hpp>
#include <boost/smart_ptr/make_shared.hpp>
#include <locale>
#include <map>
#include <new>
#include <utility>

#include "framework/common/Mutex.hpp"

namespace velkor::common {

namespace {

namespace logging = boost::log;

constexpr unsigned enabledByDefault = fatal | error | warning;

// While no sink is attached the core prints every record to standard output. With this one
// attached, which wants none, it prints nothing until the host attaches a sink of its own.
class SilentSink final : public logging::sinks::sink {
public:
    SilentSink() : sink(false) {}
    bool will_consume(const logging::attribute_value_set&) override { return false; }
    void consume(const logging::record_view&) override {}
    void flush() override {}
};

// The enabled severities of every channel that was ever named. Entries are never removed: loggers
// keep pointers to them.
class Channels {
public:
    Channels() : core(logging::core::get()), silence(boost::make_shared<SilentSink>()) {
        core->add_sink(silence);
    }
    ~Channels() { core->remove_sink(silence); }

    Channels(const Channels&) = delete;
    Channels& operator=(const Channels&) = delete;

    std::atomic<unsigned>& enabled(const std::string& channel) VELKOR_EXCLUDES(mutex) {
        const MutexLock lock(mutex);
        return severities.try_emplace(channel, enabledByDefault).first->second;
    }

private:
    boost::shared_ptr<logging::core> core;
    boost::shared_ptr<SilentSink> silence;
    Mutex mutex;
    std::map<std::string, std::atomic<unsigned>> severities VELKOR_GUARDED_BY(mutex);
};

// Made on first use, since loggers are made while other libraries are still being initialised.
Channels& channels() {
    static Channels instance;
    return instance;
}

}  // namespace

DiagnosticLogger::DiagnosticLogger(std::string channelName)
    : channel(std::move(channelName)), enabled(&channels().enabled(channel)) {}

DiagnosticLogger::~DiagnosticLogger() = default;

void DiagnosticLogger::enable(const std::string& channelName, unsigned severities) {
    channels().enabled(channelName).store(severities, std::memory_order_relaxed);
}

void DiagnosticLogger::push(Severity severity,
                            const std::function<void(std::ostream&)>& compose) const {
    logging::attribute_set attributes;
    attributes.insert("Channel", logging::attributes::constant<std::string>(channel));
    attributes.insert("Severity", logging::attributes::constant<Severity>(severity));
    const auto core = logging::core::get();
    logging::record record = core->open_record(attributes);
    if (!record) return;
    logging::record_ostream message(record);
    message.imbue(std::locale::classic());
    // Boost.Log spells truth values out unless it is told not to.
    message.stream().unsetf(std::ios_base::boolalpha);
    compose(message.stream());
    message.flush();
    // A stream only notes lack of memory; half of a message is no record.
    if (message.stream().bad()) throw std::bad_alloc();
    core->push_record(boost::move(record));
}

}  // namespace velkor::common
