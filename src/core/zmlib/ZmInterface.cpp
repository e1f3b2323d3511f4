#include <zmlib/ZmInterface.h>
#include <zmlib/ZmInterfaceOwnerDefaultImpl.h>

ZM_TYPED_OBJECT_IMPL(ZmInterface, nullptr, ZmTypedObject, nullptr)

ZmInterface::ZmInterface()
{
    attach(nullptr, ZmInterfaceOwner::ManageMemory);
}

ZmInterface::ZmInterface(ZmInterfaceOwner* owner, ZmInterfaceOwner::MemoryPolicy policy)
{
    attach(owner, policy);
}

ZmInterface::ZmInterface(const ZmInterface& other) : ZmTypedObject(other)
{
    attach(other.m_owner, ZmInterfaceOwner::StaticMemory);
}

ZmInterface::~ZmInterface() = default;

void ZmInterface::attach(ZmInterfaceOwner* owner, ZmInterfaceOwner::MemoryPolicy policy)
{
    m_owner = owner != nullptr ? owner : new ZmInterfaceOwnerDefaultImpl();
    m_owner->registerInterfaceStaticMemory(this);
    if (policy == ZmInterfaceOwner::ManageMemory) {
        m_owner->manageMemory(this);
    }
}
