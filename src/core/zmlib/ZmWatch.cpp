#include <zmlib/ZmLogFile.h>
#include <zmlib/ZmString.h>
#include <zmlib/ZmWatch.h>

#include "ZmMonotonicClock_p.h"

std::atomic<double> ZmWatch::m_tickLength{0.0};

namespace {

/// The counter: nanoseconds of the monotonic clock.
inline int64_t counterNow()
{
    return zmMonotonicNanoseconds();
}

/// The counter's frequency in ticks per second.
constexpr double kCounterFrequency = 1e9;

inline int roundedMSec(double seconds)
{
    return int(seconds * 1000.0 + (seconds < 0 ? -0.5 : 0.5));
}

} // namespace

ZmWatch::ZmWatch(bool start)
{
    if (start) {
        this->start();
    }
}

ZmWatch::ZmWatch(const char* name, bool start) : m_name(name != nullptr ? new ZmString(name) : nullptr)
{
    if (start) {
        this->start();
    }
}

ZmWatch::ZmWatch(const ZmWatch& other)
    : m_running(other.m_running), m_name(other.m_name != nullptr ? new ZmString(*other.m_name) : nullptr),
      m_lastDumpTime(other.m_lastDumpTime), m_accumulated(other.m_accumulated), m_startedAt(other.m_startedAt)
{}

ZmWatch& ZmWatch::operator=(const ZmWatch& other)
{
    if (this != &other) {
        ZmString* name = other.m_name != nullptr ? new ZmString(*other.m_name) : nullptr;
        delete m_name;
        m_name = name;
        m_running = other.m_running;
        m_lastDumpTime = other.m_lastDumpTime;
        m_accumulated = other.m_accumulated;
        m_startedAt = other.m_startedAt;
    }
    return *this;
}

ZmWatch::~ZmWatch()
{
    delete m_name;
}

void ZmWatch::start()
{
    if (m_tickLength.load(std::memory_order_relaxed) == 0.0) {
        m_tickLength.store(1.0 / kCounterFrequency, std::memory_order_relaxed);
    }
    m_lastDumpTime = -1.0f;
    m_running = true;
    m_accumulated = 0;
    m_startedAt = counterNow();
}

// Intended: cont() leaves the tick length alone, so in a process where no watch was ever started
// a continued watch measures 0; only start() sets the tick length up.
void ZmWatch::cont()
{
    m_running = true;
    m_startedAt = counterNow();
}

void ZmWatch::reset()
{
    m_running = false;
    m_accumulated = 0;
}

// Intended: stop() does not look at the running flag, so a second stop adds the time since the
// last start()/cont() once more; callers pair each stop with a start or a cont.
double ZmWatch::stop2()
{
    m_running = false;
    m_accumulated += counterNow() - m_startedAt;
    return double(m_accumulated) * m_tickLength.load(std::memory_order_relaxed);
}

float ZmWatch::stop()
{
    return float(stop2());
}

int ZmWatch::stopMSec()
{
    return roundedMSec(stop2());
}

double ZmWatch::getTime2() const
{
    if (!m_running) {
        return double(m_accumulated) * m_tickLength.load(std::memory_order_relaxed);
    }
    // The next clock reading waits for this one's arithmetic to finish, so keep the chain after
    // the reading short: what does not need the clock is summed before, and the tick length is
    // loaded afterwards (kept across the call, it would be spilled and reloaded on the way).
    const int64_t base = m_accumulated - m_startedAt;
    return double(zmMonotonicNanoseconds(base)) * m_tickLength.load(std::memory_order_relaxed);
}

float ZmWatch::getTime() const
{
    return float(getTime2());
}

int ZmWatch::getTimeMSec() const
{
    return roundedMSec(getTime2());
}

void ZmWatch::dump(int index)
{
    if (m_name == nullptr || m_name->isEmptyString()) {
        return;
    }
    const double t = getTime2();
    ZmString line;
    if (index != 0) {
        line.printf(" --- %s [%02d]: %d msec", m_name->getString(), index, int(t * 1000.0));
    } else {
        line.printf(" --- %s: %d msec", m_name->getString(), int(t * 1000.0));
    }
    if (m_lastDumpTime >= 0.0f) {
        ZmString since;
        since.printf("  (+ %d ms)", int((t - m_lastDumpTime) * 1000.0));
        line += since;
    }
    getTheLogInstance().printf("%s", line.getString());
    m_lastDumpTime = float(t);
}
