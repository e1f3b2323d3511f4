#include <zmlib/ZmScopedWatch.h>
#include <zmlib/ZmWatch.h>

ZmScopedWatch::ZmScopedWatch(ZmWatch& watch, bool reset) : m_watch(watch)
{
    if (reset) {
        m_watch.reset();
    }
    m_wasRunning = m_watch.isRunning();
    if (!m_wasRunning) {
        m_watch.cont();
    }
}

ZmScopedWatch::~ZmScopedWatch()
{
    if (!m_wasRunning) {
        m_watch.stop();
    }
}
