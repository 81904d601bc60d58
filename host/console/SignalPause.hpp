#pragma once

#include <csignal>
#include <initializer_list>

namespace velkor::host {

/// Puts signals off while it lives, for the thread that makes and destroys it.
class SignalPause {
public:
    explicit SignalPause(std::initializer_list<int> signals) noexcept;
    ~SignalPause();

    SignalPause(const SignalPause&) = delete;
    SignalPause& operator=(const SignalPause&) = delete;

private:
    sigset_t previous{};
};

}  // namespace velkor::host
