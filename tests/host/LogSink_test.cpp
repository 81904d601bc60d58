#include "host/LogSink.hpp"

#include <gtest/gtest.h>

#include <sstream>

#include "framework/common/DiagnosticLogger.hpp"

namespace velkor::host {
namespace {

TEST(LogSink, WritesOneLineForEachRecord) {
    const common::DiagnosticLogger logger("velkor::host::test");
    std::ostringstream out;
    const LogSink sink(out);
    logger.write(common::warning, "a", 1);
    logger.write(common::error, "b\x1b\nc");
    EXPECT_EQ(out.str(),
              "warning velkor::host::test: a1\n"
              "error velkor::host::test: b\\x1b\\nc\n");
}

TEST(LogSink, WritesOnlyWhatIsEnabled) {
    const common::DiagnosticLogger logger("velkor::host::enabled");
    std::ostringstream out;
    const LogSink sink(out);
    common::DiagnosticLogger::enable("velkor::host::enabled", common::error);
    logger.write(common::trace, "before");
    common::DiagnosticLogger::enable("velkor::host::enabled", common::trace);
    logger.write(common::trace, "after");
    EXPECT_EQ(out.str(), "trace velkor::host::enabled: after\n");
}

TEST(LogSink, WritesNothingOnceItIsGone) {
    const common::DiagnosticLogger logger("velkor::host::gone");
    std::ostringstream out;
    { const LogSink sink(out); }
    logger.write(common::error, "a");
    EXPECT_EQ(out.str(), "");
}

}  // namespace
}  // namespace velkor::host
