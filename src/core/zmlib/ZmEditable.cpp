#include <zmlib/ZmEditable.h>

ZmEditable::~ZmEditable() = default;

void ZmEditable::startEditing(int flags)
{
    m_editingFlags = flags;
    for (int64_t i = 0; i < m_listeners.size(); ++i) {
        m_listeners[i]->editingStarted(this);
    }
}

void ZmEditable::finishEditing()
{
    for (int64_t i = 0; i < m_listeners.size(); ++i) {
        m_listeners[i]->editingFinished(this);
    }
    m_editingFlags = 0;
}

void ZmEditable::removeEditingListener(ZmEditingListener* listener)
{
    const int64_t at = m_listeners.index(listener);
    if (at >= 0) {
        m_listeners.remove(at, 1);
    }
}
