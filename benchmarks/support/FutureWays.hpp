#pragma once

#define BOOST_THREAD_VERSION 4
#include <boost/thread/future.hpp>
#include <future>

#include "benchmarks/support/FloorFuture.hpp"
#include "framework/Future.hpp"

namespace velkor::benchmarks {

// The ways to pass one number on: the name of the contender, its promise and what is done with it,
// and a future that has its result from the start.

struct Velkor {
    static constexpr const char* name = "velkor";
    using Promise = velkor::Promise<int>;
    static auto futureOf(Promise& promise) { return promise.getFuture(); }
    static void resolve(Promise& promise) { promise.setValue(1); }
    static auto ready() { return makeReadyFuture(1); }
};

struct Floor {
    static constexpr const char* name = "floor";
    using Promise = FloorPromise<int>;
    static auto futureOf(Promise& promise) { return promise.getFuture(); }
    static void resolve(Promise& promise) { promise.setValue(1); }
    static auto ready() { return floorReadyFuture(1); }
};

struct Std {
    static constexpr const char* name = "std";
    using Promise = std::promise<int>;
    static auto futureOf(Promise& promise) { return promise.get_future(); }
    static void resolve(Promise& promise) { promise.set_value(1); }
};

struct Boost {
    static constexpr const char* name = "boost";
    using Promise = boost::promise<int>;
    static auto futureOf(Promise& promise) { return promise.get_future(); }
    static void resolve(Promise& promise) { promise.set_value(1); }
    static auto ready() { return boost::make_ready_future(1); }
};

}  // namespace velkor::benchmarks
