/// \file
/// The platform part of ZmMutex (private; shared with the wait condition).
#pragma once

#include <pthread.h>

/// Selects the constant constructor of ZmMutex.
struct ZmMutexStaticPart {};

struct ZmMutexPrivate {
    pthread_mutex_t mutex; // first: the lock and unlock calls pass its address on unchanged
    bool recursive;
    bool isStatic; // the singleton's part, in static storage: never destroyed
};
