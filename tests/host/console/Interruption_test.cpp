#include "host/console/Interruption.hpp"

#include <gtest/gtest.h>

#include <cerrno>
#include <csignal>

#include <unistd.h>

#include "host/console/SignalPause.hpp"

namespace velkor::host {
namespace {

TEST(Interruption, IsRequestedByTheSignalUntilItIsTaken) {
    const Interruption interruption;
    EXPECT_FALSE(Interruption::isRequested());
    ::raise(SIGINT);
    EXPECT_TRUE(Interruption::isRequested());
    EXPECT_TRUE(Interruption::take());
    EXPECT_FALSE(Interruption::take());
}

TEST(Interruption, LeavesNoRequestBehind) {
    {
        const Interruption interruption;
        ::raise(SIGINT);
    }
    EXPECT_FALSE(Interruption::isRequested());
}

TEST(Interruption, GivesTheSignalItsFormerMeaningBack) {
    EXPECT_EXIT(
        {
            std::signal(SIGINT, SIG_DFL);
            { const Interruption interruption; }
            ::raise(SIGINT);
        },
        ::testing::KilledBySignal(SIGINT), "");
}

TEST(Interruption, IsPutOffByAPause) {
    const Interruption interruption;
    {
        const SignalPause pause{SIGINT};
        ::raise(SIGINT);
        EXPECT_FALSE(Interruption::isRequested());
    }
    EXPECT_TRUE(Interruption::take());
}

TEST(Interruption, IsForgottenWithWhatAPausePutsOff) {
    const Interruption interruption;
    ::raise(SIGINT);
    {
        const SignalPause pause{SIGINT};
        ::raise(SIGINT);
        Interruption::forget();
    }
    EXPECT_FALSE(Interruption::isRequested());
}

// A child presses Ctrl-C again and again, since the first time may come too early.
TEST(Interruption, EndsASystemCallThatWaits) {
    EXPECT_EXIT(
        {
            int ends[2];
            char byte = 0;
            const Interruption interruption;
            const pid_t patient = ::getpid();
            if (::pipe(ends) != 0) ::_exit(1);
            if (::fork() == 0) {
                while (::getppid() == patient) ::kill(patient, SIGINT);
                ::_exit(0);
            }
            ::_exit(::read(ends[0], &byte, 1) == -1 && errno == EINTR ? 0 : 1);
        },
        ::testing::ExitedWithCode(0), "");
}

}  // namespace
}  // namespace velkor::host
