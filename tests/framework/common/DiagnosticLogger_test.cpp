#include "framework/common/DiagnosticLogger.hpp"

#include <gtest/gtest.h>
#include <unistd.h>

#include <atomic>
#include <boost/log/core.hpp>
#include <boost/log/utility/exception_handler.hpp>
#include <cstdio>
#include <fstream>
#include <iterator>
#include <locale>
#include <ostream>
#include <stdexcept>
#include <string>
#include <thread>
#include <type_traits>
#include <utility>
#include <vector>

#include "tests/support/BoundedWait.hpp"
#include "tests/support/LogCapture.hpp"
#include "tests/support/ScopedGlobalLocale.hpp"
#include "tests/support/TemporaryFile.hpp"
#include "tests/support/Thrown.hpp"

namespace {

using velkor::common::debug;
using velkor::common::DiagnosticLogger;
using velkor::common::error;
using velkor::common::fatal;
using velkor::common::Severity;
using velkor::common::trace;
using velkor::common::warning;
using velkor::testing::CommaNumbers;
using velkor::testing::everySeverity;
using velkor::testing::Latch;
using velkor::testing::LogCapture;
using velkor::testing::LogRecord;
using velkor::testing::ScopedGlobalLocale;
using velkor::testing::TemporaryFile;
using velkor::testing::thrownText;

using Texts = std::vector<std::string>;

constexpr Severity severities[] = {fatal, error, warning, debug, trace};

// A channel that no other test has named: enabled severities are kept as long as the process lives.
std::string freshChannel() {
    static std::atomic<int> number{0};
    return "diagnostic-logger-tests-" + std::to_string(++number);
}

unsigned enabledMask(const DiagnosticLogger& logger) {
    unsigned mask = 0;
    for (const Severity severity : severities) {
        if (logger.isEnabled(severity)) mask |= severity;
    }
    return mask;
}

// Counts how often it is composed into a message.
struct Counting {
    int& compositions;
    friend std::ostream& operator<<(std::ostream& out, const Counting& part) {
        ++part.compositions;
        return out << "counted";
    }
};

struct FailsToCompose {
    friend std::ostream& operator<<(std::ostream&, const FailsToCompose&) {
        throw std::out_of_range("can't be written");
    }
};

struct WritesItself {
    const DiagnosticLogger& logger;
    friend std::ostream& operator<<(std::ostream& out, const WritesItself& part) {
        part.logger.write(debug, "inner");
        return out << "outer";
    }
};

// What the process writes to a file descriptor while this lives.
class DescriptorCapture {
public:
    explicit DescriptorCapture(FILE* captured) : stream(captured), saved(::dup(fileno(captured))) {
        std::fflush(stream);
        FILE* const target = std::fopen(file.path().c_str(), "w");
        ::dup2(fileno(target), fileno(stream));
        std::fclose(target);
    }

    ~DescriptorCapture() {
        std::fflush(stream);
        ::dup2(saved, fileno(stream));
        ::close(saved);
    }

    DescriptorCapture(const DescriptorCapture&) = delete;
    DescriptorCapture& operator=(const DescriptorCapture&) = delete;

    std::string text() const {
        std::fflush(stream);
        std::ifstream written(file.path());
        return std::string(std::istreambuf_iterator<char>(written), {});
    }

private:
    const TemporaryFile file{""};
    FILE* const stream;
    const int saved;
};

class DiagnosticLoggerTest : public ::testing::Test {
protected:
    const std::string channel = freshChannel();
    const DiagnosticLogger logger{channel};
};

// Severities

TEST_F(DiagnosticLoggerTest, SeveritiesAreBits) {
    EXPECT_EQ(fatal, 1U);
    EXPECT_EQ(error, 2U);
    EXPECT_EQ(warning, 4U);
    EXPECT_EQ(debug, 8U);
    EXPECT_EQ(trace, 16U);
}

TEST_F(DiagnosticLoggerTest, FatalErrorAndWarningAreEnabledByDefault) {
    EXPECT_EQ(enabledMask(logger), 1U | 2U | 4U);
}

TEST_F(DiagnosticLoggerTest, EnableHoldsForALoggerThatExists) {
    DiagnosticLogger::enable(channel, debug);
    EXPECT_EQ(enabledMask(logger), debug);
}

TEST_F(DiagnosticLoggerTest, EnableHoldsForALoggerMadeLater) {
    const std::string name = freshChannel();
    DiagnosticLogger::enable(name, trace | fatal);
    const DiagnosticLogger later(name);
    EXPECT_EQ(enabledMask(later), trace | fatal);
}

TEST_F(DiagnosticLoggerTest, EnableHoldsForAllLoggersOfTheChannel) {
    const DiagnosticLogger second(channel);
    DiagnosticLogger::enable(channel, trace);
    const DiagnosticLogger third(channel);
    EXPECT_EQ(enabledMask(logger), trace);
    EXPECT_EQ(enabledMask(second), trace);
    EXPECT_EQ(enabledMask(third), trace);
}

TEST_F(DiagnosticLoggerTest, EnableOutlivesTheLoggersOfTheChannel) {
    const std::string name = freshChannel();
    {
        const DiagnosticLogger shortLived(name);
        DiagnosticLogger::enable(name, debug);
    }
    EXPECT_EQ(enabledMask(DiagnosticLogger(name)), debug);
}

TEST_F(DiagnosticLoggerTest, EnableReplacesTheMask) {
    DiagnosticLogger::enable(channel, everySeverity);
    DiagnosticLogger::enable(channel, warning);
    EXPECT_EQ(enabledMask(logger), warning);
}

TEST_F(DiagnosticLoggerTest, EmptyMaskDisablesEverything) {
    DiagnosticLogger::enable(channel, 0);
    EXPECT_EQ(enabledMask(logger), 0U);
}

TEST_F(DiagnosticLoggerTest, UnknownBitsInTheMaskDoNoHarm) {
    DiagnosticLogger::enable(channel, ~0U);
    EXPECT_EQ(enabledMask(logger), everySeverity);
}

TEST_F(DiagnosticLoggerTest, EnableLeavesOtherChannelsAlone) {
    const DiagnosticLogger other(freshChannel());
    DiagnosticLogger::enable(channel, everySeverity);
    EXPECT_EQ(enabledMask(other), 1U | 2U | 4U);
}

TEST_F(DiagnosticLoggerTest, NestedChannelInheritsNothing) {
    const DiagnosticLogger nested(channel + "::nested");
    DiagnosticLogger::enable(channel, everySeverity);
    EXPECT_EQ(enabledMask(nested), 1U | 2U | 4U);
}

TEST_F(DiagnosticLoggerTest, NestedChannelGivesNothingUpwards) {
    DiagnosticLogger::enable(channel + "::nested", everySeverity);
    EXPECT_EQ(enabledMask(logger), 1U | 2U | 4U);
}

TEST_F(DiagnosticLoggerTest, ChannelMayHaveAnEmptyName) {
    const LogCapture capture("");
    DiagnosticLogger("").write(fatal, "text");
    EXPECT_EQ(capture.messages(), Texts{"text"});
}

// Records

class DiagnosticLoggerRecord : public DiagnosticLoggerTest,
                               public ::testing::WithParamInterface<Severity> {};

TEST_P(DiagnosticLoggerRecord, CarriesChannelSeverityAndMessage) {
    const LogCapture capture(channel);
    logger.write(GetParam(), "some ", "text");
    const std::vector<LogRecord> records = capture.records();
    ASSERT_EQ(records.size(), 1U);
    EXPECT_EQ(records[0].channel, channel);
    EXPECT_EQ(records[0].severity, GetParam());
    EXPECT_EQ(records[0].message, "some text");
}

TEST_P(DiagnosticLoggerRecord, IsWrittenWhenOnlyItsSeverityIsEnabled) {
    const LogCapture capture(channel, GetParam());
    logger.write(GetParam(), "text");
    EXPECT_EQ(capture.messages(), Texts{"text"});
}

TEST_P(DiagnosticLoggerRecord, IsNotWrittenWhenOnlyItsSeverityIsDisabled) {
    const LogCapture capture(channel, everySeverity & ~unsigned{GetParam()});
    logger.write(GetParam(), "text");
    EXPECT_EQ(capture.messages(), Texts{});
}

INSTANTIATE_TEST_SUITE_P(Severity, DiagnosticLoggerRecord, ::testing::ValuesIn(severities),
                         [](const auto& row) { return "Bit" + std::to_string(row.param); });

TEST_F(DiagnosticLoggerTest, RecordsKeepTheirOrder) {
    const LogCapture capture(channel);
    logger.write(debug, "first");
    logger.write(fatal, "second");
    EXPECT_EQ(capture.messages(), (Texts{"first", "second"}));
}

TEST_F(DiagnosticLoggerTest, MessageIsMadeOfAllParts) {
    const LogCapture capture(channel);
    logger.write(debug, std::string("key"), ' ', 12, ' ', 1.5, ' ', true, ' ', 7U);
    EXPECT_EQ(capture.messages(), Texts{"key 12 1.5 1 7"});
}

TEST_F(DiagnosticLoggerTest, MessageMayBeEmpty) {
    const LogCapture capture(channel);
    logger.write(debug, "");
    EXPECT_EQ(capture.messages(), Texts{""});
}

TEST_F(DiagnosticLoggerTest, MessageKeepsEveryByte) {
    const LogCapture capture(channel);
    const std::string text("\0\n\xff\xc3\xa9%s", 7);
    logger.write(debug, text);
    EXPECT_EQ(capture.messages(), Texts{text});
}

TEST_F(DiagnosticLoggerTest, MessageMayBeLong) {
    const LogCapture capture(channel);
    const std::string text(1000000, 'x');
    logger.write(debug, text);
    EXPECT_EQ(capture.messages(), Texts{text});
}

TEST_F(DiagnosticLoggerTest, NumbersAreWrittenInTheClassicLocale) {
    const LogCapture capture(channel);
    const ScopedGlobalLocale foreign(std::locale(std::locale::classic(), new CommaNumbers));
    logger.write(debug, 1234567, ' ', 1234.5, ' ', std::boolalpha, true);
    EXPECT_EQ(capture.messages(), Texts{"1234567 1234.5 true"});
}

TEST_F(DiagnosticLoggerTest, FormatOfOneRecordDoesNotReachTheNext) {
    const LogCapture capture(channel);
    logger.write(debug, std::hex, 255);
    logger.write(debug, 255);
    EXPECT_EQ(capture.messages(), (Texts{"ff", "255"}));
}

// Composition

TEST_F(DiagnosticLoggerTest, EnabledRecordIsComposedOnce) {
    int compositions = 0;
    const LogCapture capture(channel);
    logger.write(debug, Counting{compositions});
    EXPECT_EQ(compositions, 1);
}

TEST_F(DiagnosticLoggerTest, DisabledRecordIsNotComposed) {
    int compositions = 0;
    const LogCapture capture(channel, fatal);
    logger.write(debug, Counting{compositions});
    EXPECT_EQ(compositions, 0);
}

TEST_F(DiagnosticLoggerTest, RecordIsNotComposedWithoutASink) {
    int compositions = 0;
    logger.write(fatal, Counting{compositions});
    EXPECT_EQ(compositions, 0);
}

TEST_F(DiagnosticLoggerTest, RecordThatNoSinkWantsIsNotComposed) {
    int compositions = 0;
    const LogCapture other(freshChannel());
    logger.write(fatal, Counting{compositions});
    EXPECT_EQ(compositions, 0);
}

TEST_F(DiagnosticLoggerTest, ExceptionOfACompositionReachesTheWriter) {
    const LogCapture capture(channel);
    EXPECT_EQ(thrownText<std::out_of_range>([&] { logger.write(debug, FailsToCompose{}); }),
              "can't be written");
}

TEST_F(DiagnosticLoggerTest, RecordWhoseCompositionFailsIsDropped) {
    const LogCapture capture(channel);
    EXPECT_THROW(logger.write(debug, "begun ", FailsToCompose{}), std::out_of_range);
    logger.write(debug, "next");
    EXPECT_EQ(capture.messages(), Texts{"next"});
}

TEST_F(DiagnosticLoggerTest, CompositionMayWriteARecordOfItsOwn) {
    const LogCapture capture(channel);
    logger.write(debug, WritesItself{logger});
    EXPECT_EQ(capture.messages(), (Texts{"inner", "outer"}));
}

// Sinks

// What is written to the process's standard output and error besides a marker.
template <class Action>
std::string printedBy(FILE* stream, Action action) {
    const DescriptorCapture capture(stream);
    std::fputs("[", stream);
    action();
    std::fputs("]", stream);
    return capture.text();
}

TEST_F(DiagnosticLoggerTest, NothingIsPrintedToStandardOutputWithoutASink) {
    EXPECT_EQ(printedBy(stdout, [this] { logger.write(fatal, "text"); }), "[]");
}

TEST_F(DiagnosticLoggerTest, NothingIsPrintedToStandardErrorWithoutASink) {
    EXPECT_EQ(printedBy(stderr, [this] { logger.write(fatal, "text"); }), "[]");
}

TEST_F(DiagnosticLoggerTest, NothingIsPrintedOnceTheLastSinkIsGone) {
    { const LogCapture capture(channel); }
    EXPECT_EQ(printedBy(stdout, [this] { logger.write(fatal, "text"); }), "[]");
}

class ThrowingSink final : public boost::log::sinks::sink {
public:
    ThrowingSink() : sink(false) {}
    bool will_consume(const boost::log::attribute_value_set&) override { return true; }
    void consume(const boost::log::record_view&) override {
        throw std::runtime_error("disk is full");
    }
    void flush() override {}
};

class DiagnosticLoggerWithThrowingSink : public DiagnosticLoggerTest {
protected:
    DiagnosticLoggerWithThrowingSink() { boost::log::core::get()->add_sink(sink); }
    ~DiagnosticLoggerWithThrowingSink() override {
        boost::log::core::get()->remove_sink(sink);
        boost::log::core::get()->set_exception_handler(nullptr);
    }

    const boost::shared_ptr<ThrowingSink> sink = boost::make_shared<ThrowingSink>();
};

TEST_F(DiagnosticLoggerWithThrowingSink, ExceptionReachesTheWriter) {
    EXPECT_EQ(thrownText<std::runtime_error>([this] { logger.write(fatal, "text"); }),
              "disk is full");
}

TEST_F(DiagnosticLoggerWithThrowingSink, HandlerOfTheHostKeepsItFromTheWriter) {
    boost::log::core::get()->set_exception_handler(boost::log::make_exception_suppressor());
    EXPECT_NO_THROW(logger.write(fatal, "text"));
}

TEST_F(DiagnosticLoggerWithThrowingSink, LoggerWorksOnAfterwards) {
    EXPECT_THROW(logger.write(fatal, "lost"), std::runtime_error);
    boost::log::core::get()->remove_sink(sink);
    const LogCapture capture(channel);
    logger.write(fatal, "kept");
    EXPECT_EQ(capture.messages(), Texts{"kept"});
}

// Threads

TEST_F(DiagnosticLoggerTest, ThreadsWriteWhileSeveritiesChange) {
    constexpr int writers = 3;
    constexpr int recordsEach = 200;
    const LogCapture capture(channel, fatal);
    Latch start(writers + 1);
    std::vector<std::thread> threads;
    for (int writer = 0; writer < writers; ++writer) {
        threads.emplace_back([&] {
            EXPECT_TRUE(start.arriveAndWait());
            const DiagnosticLogger own(channel);
            for (int i = 0; i < recordsEach; ++i) {
                own.write(fatal, "always");
                own.write(debug, "sometimes");
            }
        });
    }
    EXPECT_TRUE(start.arriveAndWait());
    for (int i = 0; i < recordsEach; ++i) {
        DiagnosticLogger::enable(channel, i % 2 == 0 ? fatal | debug : fatal);
    }
    for (std::thread& thread : threads) thread.join();
    int always = 0;
    for (const LogRecord& record : capture.records()) {
        EXPECT_EQ(record.message, record.severity == fatal ? "always" : "sometimes");
        if (record.severity == fatal) ++always;
    }
    EXPECT_EQ(always, writers * recordsEach);
}

TEST_F(DiagnosticLoggerTest, ThreadsMakeLoggersOfNewChannels) {
    constexpr int threadCount = 4;
    const std::string shared = freshChannel();
    DiagnosticLogger::enable(shared, debug);
    Latch start(threadCount);
    std::vector<std::thread> threads;
    for (int thread = 0; thread < threadCount; ++thread) {
        threads.emplace_back([&] {
            EXPECT_TRUE(start.arriveAndWait());
            for (int i = 0; i < 50; ++i) {
                EXPECT_EQ(enabledMask(DiagnosticLogger(freshChannel())), 1U | 2U | 4U);
                EXPECT_EQ(enabledMask(DiagnosticLogger(shared)), debug);
            }
        });
    }
    for (std::thread& thread : threads) thread.join();
}

TEST_F(DiagnosticLoggerTest, IsNeitherCopiedNorMoved) {
    EXPECT_FALSE(std::is_copy_constructible_v<DiagnosticLogger>);
    EXPECT_FALSE(std::is_move_constructible_v<DiagnosticLogger>);
    EXPECT_FALSE(std::is_copy_assignable_v<DiagnosticLogger>);
}

}  // namespace
