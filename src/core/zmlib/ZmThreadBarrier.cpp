#include <zmlib/ZmThreadBarrier.h>

ZmThreadBarrier::ZmThreadBarrier(int count) : m_count(count), m_remaining(count), m_generation(0)
{}

bool ZmThreadBarrier::enter()
{
    m_mutex.lock();
    const int generation = m_generation;
    // "At most one left" rather than "exactly one", so that a count below 1 cannot hang everyone.
    if (m_remaining-- <= 1) {
        ++m_generation;
        m_remaining = m_count;
        m_condition.wakeAll();
        m_mutex.unlock();
        return true;
    }
    while (generation == m_generation) {
        m_condition.wait(&m_mutex);
    }
    m_mutex.unlock();
    return false;
}
