// ZmWaitCondition is a thin layer over the POSIX condition variable: all of it is platform code.
#include <zmlib/ZmLogFile.h>
#include <zmlib/ZmMutex.h>
#include <zmlib/ZmMutex_p.h>
#include <zmlib/ZmSharedCount_p.h>
#include <zmlib/ZmWaitCondition.h>
#include <zmlib/ZmWaitCondition_p.h>

#include <pthread.h>

struct ZmWaitConditionPrivate {
    pthread_cond_t cond;
    ZmSharedCount refs;

    static void destroy(ZmWaitConditionPrivate* d)
    {
        const int rc = pthread_cond_destroy(&d->cond);
        if (rc != 0) {
            getTheLogInstance().errorf("ZmWaitCondition::~ZmWaitCondition() failed (error code: %d)\n", rc);
        }
        delete d;
    }
};

ZmWaitCondition::ZmWaitCondition() : m_d(new ZmWaitConditionPrivate)
{
    // Deadlines are measured on the monotonic clock: a step of the wall clock (an administrator, a
    // time daemon) must neither stretch nor cut a time-out.
    pthread_condattr_t attr;
    int rc = pthread_condattr_init(&attr);
    if (rc == 0) {
        rc = pthread_condattr_setclock(&attr, CLOCK_MONOTONIC);
        if (rc == 0) {
            rc = pthread_cond_init(&m_d->cond, &attr);
        }
        pthread_condattr_destroy(&attr);
    }
    if (rc != 0) {
        getTheLogInstance().errorf("ZmWaitCondition::ZmWaitCondition() failed (error code: %d)\n", rc);
    }
}

// Copies share the condition on purpose: the copy and the source are the same condition.
ZmWaitCondition::ZmWaitCondition(const ZmWaitCondition& other)
    : m_d(ZmSharedPart<ZmWaitConditionPrivate>::share(other.m_d))
{}

ZmWaitCondition& ZmWaitCondition::operator=(const ZmWaitCondition& other)
{
    if (this != &other) {
        ZmSharedPart<ZmWaitConditionPrivate>::assign(m_d, other.m_d);
    }
    return *this;
}

ZmWaitCondition::~ZmWaitCondition()
{
    ZmSharedPart<ZmWaitConditionPrivate>::release(m_d);
}

bool ZmWaitCondition::wait(ZmMutex* mutex, unsigned long ms)
{
    pthread_mutex_t* m = &mutex->privatePart()->mutex;
    if (ms >= 4294967295UL) {
        const int rc = pthread_cond_wait(&m_d->cond, m);
        if (rc != 0) {
            getTheLogInstance().errorf("ZmWaitCondition::wait() failed (error code: %d)\n", rc);
            return false;
        }
        return true;
    }
    timespec now;
    clock_gettime(CLOCK_MONOTONIC, &now);
    const timespec deadline = zmWaitConditionDeadline(now, ms);
    // Time-outs and errors alike answer false without a log line: a time-out is the normal outcome.
    return pthread_cond_timedwait(&m_d->cond, m, &deadline) == 0;
}

void ZmWaitCondition::wakeOne()
{
    const int rc = pthread_cond_signal(&m_d->cond);
    if (rc != 0) {
        getTheLogInstance().errorf("ZmWaitCondition::wakeOne() failed (error code: %d)\n", rc);
    }
}

void ZmWaitCondition::wakeAll()
{
    const int rc = pthread_cond_broadcast(&m_d->cond);
    if (rc != 0) {
        getTheLogInstance().errorf("ZmWaitCondition::wakeAll() failed (error code: %d)\n", rc);
    }
}
