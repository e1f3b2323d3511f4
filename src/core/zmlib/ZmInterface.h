/// \file
/// Typed interface objects attached to an owner.
#pragma once

#include <zmlib/ZmExport.h>
#include <zmlib/ZmInterfaceOwner.h>
#include <zmlib/ZmTypedObject.h>

/// An interface (component) registered with a `ZmInterfaceOwner`.
///
/// An interface keeps no count of its own: `ref()`/`unref()` act on the owner, so the owner and
/// all its interfaces live and die together. Constructed without an owner, it makes a
/// `ZmInterfaceOwnerDefaultImpl` (count 0) for itself. Single-threaded.
class ZMLIB_API ZmInterface : public ZmTypedObject {
    ZM_TYPED_OBJECT
public:
    /// A fresh default owner that manages this interface.
    ZmInterface();
    /// Registers with \p owner (a default owner when null); with ManageMemory the owner deletes
    /// this interface in its teardown.
    ZmInterface(ZmInterfaceOwner* owner, ZmInterfaceOwner::MemoryPolicy policy);
    /// Registers the copy with the same owner as static memory: the owner never deletes a copy,
    /// whose storage belongs to whoever made it.
    ZmInterface(const ZmInterface& other);
    ZmInterface& operator=(const ZmInterface&) = delete;

    ZmInterfaceOwner* getOwner() const { return m_owner; }
    ZmTypedObject* getInterface(const ZmTypeInfo* t) const { return m_owner->getInterface(t); }
    void getAllInterfaces(ZmDArray<ZmTypedObject*>& list) const { m_owner->getAllInterfaces(list); }
    void handleObject(ZmHandable* object) const { m_owner->handleObject(object); }
    void manageMemory(ZmTypedObject* iface) const { m_owner->manageMemory(iface); }
    void ref() const { m_owner->ref(); }
    void unref() const { m_owner->unref(); }

protected:
    ~ZmInterface() override;

private:
    void attach(ZmInterfaceOwner* owner, ZmInterfaceOwner::MemoryPolicy policy);

    ZmInterfaceOwner* m_owner = nullptr;
};
