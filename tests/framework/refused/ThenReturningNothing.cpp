#include "framework/Future.hpp"

void attach(velkor::Future<int>& future) {
    future.then([](velkor::Future<int>&& result) {
#ifdef MISTAKE_PUT_RIGHT
        return result.get();
#else
        result.get();
#endif
    });
}
