#include <zmlib/ZmHandable.h>

ZmHandable::~ZmHandable() = default;

void ZmHandable::notifyDelete()
{}

void ZmHandable::destroy() const
{
    auto* self = const_cast<ZmHandable*>(this);
    self->m_destructionInProgress = true;
    self->notifyDelete();
    self->m_destructorCalled = true;
    delete self;
}
