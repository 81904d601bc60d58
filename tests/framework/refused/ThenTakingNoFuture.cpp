#include "framework/Future.hpp"

void attach(velkor::Future<int>& future) {
#ifdef MISTAKE_PUT_RIGHT
    future.then([](velkor::Future<int>&& result) { return result.get(); });
#else
    future.then([](int result) { return result; });
#endif
}
