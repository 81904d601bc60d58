#include "framework/common/Mutex.hpp"

class Counter {
public:
    void increment() {
#ifdef MISTAKE_PUT_RIGHT
        const velkor::common::MutexLock lock(mutex);
#endif
        ++count;
    }

private:
    velkor::common::Mutex mutex;
    int count VELKOR_GUARDED_BY(mutex) = 0;
};
