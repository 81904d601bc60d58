#pragma once

#include <iostream>
#include <new>
#include <string>

namespace velkor::configuration::detail {

/// Says on standard error that a subscriber of a "value" or of a "change" threw, and of which key
/// or prefix: "Error in configuration WHAT subscriber: NAME", in one piece unless memory is short.
/// A broken standard error must not keep the other subscribers from being served, and there is
/// nowhere left to report to: what it throws is dropped.
inline void reportSubscriberError(const char* what, const std::string& name) noexcept {
    try {
        try {
            std::cerr << "Error in configuration " + std::string(what) + " subscriber: " + name +
                             '\n'
                      << std::flush;
        } catch (const std::bad_alloc&) {
            std::cerr << "Error in configuration " << what << " subscriber: " << name << '\n'
                      << std::flush;
        }
    } catch (...) {
        return;
    }
}

}  // namespace velkor::configuration::detail
