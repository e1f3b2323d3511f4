/// \file
/// The private part of ZmThread and its platform interface (private). ZmThread_posix.cpp
/// implements the interface.
#pragma once

#include <zmlib/ZmMutex.h>
#include <zmlib/ZmSharedCount_p.h>
#include <zmlib/ZmString.h>
#include <zmlib/ZmWaitCondition.h>

#include <atomic>
#include <cstddef>

class ZmThread;

/// Room for the platform's thread-creation attributes, kept in place so that a thread object
/// costs one allocation; the platform file checks that its attributes fit.
struct alignas(alignof(std::max_align_t)) ZmThreadAttributes {
    unsigned char storage[64];
};

struct ZmThreadPrivate {
    ZmThreadAttributes attributes;
    // Written under the state mutex; read without it by running()/finished().
    std::atomic<int> state{0};
    ZmMutex stateMutex;
    ZmWaitCondition finished;
    ZmString name;
    // The copy whose start() launched the current run.
    ZmThread* runner ZM_GUARDED_BY(stateMutex) = nullptr;
    // Every ZmThread sharing this part holds one reference, and so does a run that is going.
    ZmSharedCount refs;

    static void destroy(ZmThreadPrivate* d);
};

/// Initialises the default creation attributes in place: 0, or the system's error code.
int zmThreadAttributesInit(ZmThreadAttributes& a);
/// Destroys what zmThreadAttributesInit() made: 0, or the system's error code.
int zmThreadAttributesDestroy(ZmThreadAttributes& a);
/// Runs \p body(\p arg) on a new thread made with \p a, which nobody joins: 0, or the system's
/// error code (the body then never runs).
int zmThreadLaunch(ZmThreadAttributes& a, void* (*body)(void*), void* arg);
/// Sleeps \p ms milliseconds, resuming after signals; 0 gives up the processor once instead.
void zmThreadSleep(unsigned long ms);
