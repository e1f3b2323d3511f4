/// \file
/// Objects that carry typed interface objects, looked up by type.
#pragma once

#include <zmlib/ZmDArray.h>
#include <zmlib/ZmExport.h>
#include <zmlib/ZmHandable.h>
#include <zmlib/ZmHandle.h>
#include <zmlib/ZmTypedObject.h>

/// An owner of any number of typed interface objects (components), found by type with
/// `getInterface`.
///
/// Interfaces are registered either as static memory (the owner never deletes them) or as managed
/// memory (the owner deletes them in its teardown); the owner can also hold references to other
/// counted objects. A later registration shadows an earlier one of the same type. An optional
/// attach-once callback runs before the first lookup, so that interfaces can be attached lazily.
///
/// The owner's lifetime is the subclass's business (`ref`/`unref`); `notifyDelete()` tears down
/// the interfaces and references. Note that the destructor alone deletes no owned interface: an
/// owner is expected to die through `unref()`. Single-threaded.
class ZMLIB_API ZmInterfaceOwner : public ZmTypedObject {
    ZM_TYPED_OBJECT
public:
    enum MemoryPolicy {
        StaticMemory = 0, ///< the owner does not delete the interface
        ManageMemory = 1  ///< the owner deletes it in its teardown
    };

    ~ZmInterfaceOwner() override;
    virtual void ref() const = 0;
    virtual void unref() const = 0;

    void registerInterface(ZmTypedObject* iface, MemoryPolicy policy);
    void registerInterfaceStaticMemory(ZmTypedObject* iface);
    void registerInterfaceManageMemory(ZmTypedObject* iface);
    /// The owner deletes \p iface in its teardown (without registering it).
    void manageMemory(ZmTypedObject* iface);
    /// Keeps a counted reference to \p object until the teardown.
    void handleObject(ZmHandable* object);

    /// The most recently registered interface of type \p t, else the owner itself when it is of
    /// type \p t, else null (also for a null \p t).
    ZmTypedObject* getInterface(const ZmTypeInfo* t);
    /// The registered interfaces, last registered first, then the owner itself.
    void getAllInterfaces(ZmDArray<ZmTypedObject*>& list);
    /// Sets the callback that runs (once) before the next lookup.
    void registerAttachInterfacesOnceCB(void (*cb)(void*), void* userData);
    /// Runs the attach-once callback now, if one is pending.
    void attachInterfacesOnce();

protected:
    ZmInterfaceOwner();
    /// Teardown: forgets the registered interfaces, deletes the owned ones (last first), releases
    /// the held references (first first).
    virtual void notifyDelete();

private:
    ZmDArray<ZmTypedObject*> m_registered;
    ZmDArray<ZmHandle<ZmHandable>> m_held;
    ZmDArray<ZmTypedObject*> m_owned;
    void (*m_attachOnceCB)(void*) = nullptr;
    void* m_attachOnceData = nullptr;
};
