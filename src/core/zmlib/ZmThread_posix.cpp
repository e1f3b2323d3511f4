#include <zmlib/ZmThread.h>
#include <zmlib/ZmThread_p.h>

#include <cerrno>
#include <new>
#include <pthread.h>
#include <sched.h>
#include <time.h>
#include <unistd.h>

static_assert(sizeof(pthread_attr_t) <= sizeof(ZmThreadAttributes),
              "the thread attributes outgrow their room");
static_assert(alignof(pthread_attr_t) <= alignof(ZmThreadAttributes),
              "the thread attributes need more alignment");

namespace {

pthread_attr_t* native(ZmThreadAttributes& a)
{
    return std::launder(reinterpret_cast<pthread_attr_t*>(a.storage));
}

} // namespace

int zmThreadAttributesInit(ZmThreadAttributes& a)
{
    return pthread_attr_init(new (a.storage) pthread_attr_t);
}

int zmThreadAttributesDestroy(ZmThreadAttributes& a)
{
    return pthread_attr_destroy(native(a));
}

int zmThreadLaunch(ZmThreadAttributes& a, void* (*body)(void*), void* arg)
{
    pthread_t handle;
    const int rc = pthread_create(&handle, native(a), body, arg);
    if (rc == 0) {
        pthread_detach(handle);
    }
    return rc;
}

void zmThreadSleep(unsigned long ms)
{
    if (ms == 0) {
        sched_yield();
        return;
    }
    timespec t;
    t.tv_sec = static_cast<time_t>(ms / 1000);
    t.tv_nsec = static_cast<long>(ms % 1000) * 1000000;
    while (nanosleep(&t, &t) != 0 && errno == EINTR) {
    }
}

unsigned long kvCurrentProcessId()
{
    return static_cast<unsigned long>(getpid());
}

unsigned long kvCurrentThreadId()
{
    return static_cast<unsigned long>(gettid());
}
