#pragma once

#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <memory>
#include <thread>
#include <utility>

#include "configuration/ConfigurationImpl.hpp"
#include "framework/reactive_streams/CallbackSubscriber.hpp"
#include "tests/support/BoundedWait.hpp"

namespace velkor::testing {

/// Opens when the process begins to end, before the objects of libraries do.
inline Latch& processEnd() {
    static auto* const end = new Latch;  // outlives every thread
    return *end;
}

/// Ends the process with 0, and opens `processEnd`.
[[noreturn]] inline void endProcess() {
    std::atexit([] { processEnd().countDown(); });
    std::exit(EXIT_SUCCESS);
}

/// Returns a while after the process has begun to end, and says so to standard error: a process
/// that does not wait for the calling thread has ended by then.
inline void outlastTheEnd() {
    if (!processEnd().wait()) return;
    std::this_thread::sleep_for(std::chrono::milliseconds(100));
    std::fputs("waited for", stderr);
}

/// Ends the process while `source`, which holds `key` and which `change` makes change by itself,
/// tells a watcher of that: its thread has the last references then, to it and to the store.
template <class Source, class Change>
[[noreturn]] void endWhileTold(std::shared_ptr<Source> source, Change change) {
    auto told = std::make_shared<Latch>();
    auto store = std::make_shared<configuration::ConfigurationImpl>();
    store->addSource("layer", "", 1, false, source).get();
    auto watching = reactive_streams::subscribe<configuration::OptionChange>(
        *store->watchChanges(""),
        {[told, main = std::this_thread::get_id()](const configuration::OptionChange&) {
             if (std::this_thread::get_id() == main) return;
             told->countDown();
             outlastTheEnd();
         },
         {},
         {}});
    change(*source);
    if (!told->wait()) std::_Exit(EXIT_FAILURE);
    source.reset();
    store.reset();
    endProcess();
}

}  // namespace velkor::testing
