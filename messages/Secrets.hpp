#pragma once

#include <functional>
#include <string>

namespace velkor::messages {

/// The options whose values a front end must not show.
struct Secrets {
    /// Whether `key` is one of them now. Called from any thread, for each option that is shown; may
    /// be empty: nothing is secret.
    std::function<bool(const std::string& key)> contains{};

    std::string mark{};  ///< What is shown in the place of such a value.
};

}  // namespace velkor::messages
