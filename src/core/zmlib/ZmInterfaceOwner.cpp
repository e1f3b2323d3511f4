#include <zmlib/ZmInterfaceOwner.h>
#include <zmlib/ZmInterfaceOwnerDefaultImpl.h>

ZM_TYPED_OBJECT_IMPL(ZmInterfaceOwner, nullptr, ZmTypedObject, nullptr)

ZmInterfaceOwner::ZmInterfaceOwner() = default;

ZmInterfaceOwner::~ZmInterfaceOwner()
{
    m_registered.clear();
    m_owned.remax(0, 0);
    m_held.clear();
}

void ZmInterfaceOwner::registerInterface(ZmTypedObject* iface, MemoryPolicy policy)
{
    if (policy == ManageMemory) {
        registerInterfaceManageMemory(iface);
    } else {
        registerInterfaceStaticMemory(iface);
    }
}

void ZmInterfaceOwner::registerInterfaceStaticMemory(ZmTypedObject* iface)
{
    m_registered.append(iface);
}

void ZmInterfaceOwner::registerInterfaceManageMemory(ZmTypedObject* iface)
{
    m_registered.append(iface);
    m_owned.append(iface);
}

void ZmInterfaceOwner::manageMemory(ZmTypedObject* iface)
{
    m_owned.append(iface);
}

void ZmInterfaceOwner::handleObject(ZmHandable* object)
{
    m_held.append(ZmHandle<ZmHandable>(object));
}

void ZmInterfaceOwner::attachInterfacesOnce()
{
    // Cleared before the call, so a lookup made from inside the callback does not re-enter it.
    if (void (*cb)(void*) = m_attachOnceCB) {
        m_attachOnceCB = nullptr;
        cb(m_attachOnceData);
    }
}

ZmTypedObject* ZmInterfaceOwner::getInterface(const ZmTypeInfo* t)
{
    attachInterfacesOnce();
    if (t == nullptr) {
        return nullptr;
    }
    for (int64_t i = m_registered.size() - 1; i >= 0; --i) {
        if (m_registered[i]->getTypeId()->isOfType(t)) {
            return m_registered[i];
        }
    }
    return isOfType(t) ? this : nullptr;
}

void ZmInterfaceOwner::getAllInterfaces(ZmDArray<ZmTypedObject*>& list)
{
    attachInterfacesOnce();
    list.clear();
    for (int64_t i = m_registered.size() - 1; i >= 0; --i) {
        list.append(m_registered[i]);
    }
    list.append(this);
}

void ZmInterfaceOwner::registerAttachInterfacesOnceCB(void (*cb)(void*), void* userData)
{
    m_attachOnceCB = cb;
    m_attachOnceData = userData;
}

void ZmInterfaceOwner::notifyDelete()
{
    m_registered.clear();
    ZmTypedObject* iface = nullptr;
    while (m_owned.pop(iface) != 0) {
        delete iface;
    }
    m_held.clear();
}

ZmInterfaceOwnerDefaultImpl::ZmInterfaceOwnerDefaultImpl() = default;

ZmInterfaceOwnerDefaultImpl::~ZmInterfaceOwnerDefaultImpl() = default;
