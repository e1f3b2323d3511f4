/// \file
/// The platform part of ZmMutex (private; shared with the wait condition).
#pragma once

#include <pthread.h>

struct ZmMutexPrivate {
    pthread_mutex_t mutex;
    bool recursive;
};
