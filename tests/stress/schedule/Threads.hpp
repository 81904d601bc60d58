#pragma once

#include <pthread.h>

#include <ctime>

/// The functions of the system that Interposition.cpp takes the place of, in this program and in
/// the libraries that it loads.
namespace velkor::testing::schedule::real {

int lock(pthread_mutex_t* mutex);
int tryLock(pthread_mutex_t* mutex);
int unlock(pthread_mutex_t* mutex);
int wait(pthread_cond_t* condition, pthread_mutex_t* mutex);
int waitUntil(pthread_cond_t* condition, pthread_mutex_t* mutex, const timespec* end);
int waitUntil(pthread_cond_t* condition, pthread_mutex_t* mutex, clockid_t clock,
              const timespec* end);
int notifyOne(pthread_cond_t* condition);
int notifyAll(pthread_cond_t* condition);
int yield();
int sleep(const timespec* asked, timespec* left);

}  // namespace velkor::testing::schedule::real
