/// \file
/// Run-time type descriptors and their registry.
#pragma once

#include <zmlib/ZmDArray.h>
#include <zmlib/ZmExport.h>

class ZmTypedObject;

/// Describes a class: its name, an optional factory and up to two parent descriptors.
///
/// A registering descriptor inserts itself into one process-wide registry kept sorted by name
/// (byte-wise, as unsigned characters) and removes itself when destroyed. Descriptors are
/// function-local statics built by each class's `getClassTypeId()`. The registry is built lazily
/// and has no lock: register descriptors during start-up, before other threads look types up.
/// Nothing here reports errors: lookups answer null.
class ZMLIB_API ZmTypeInfo {
public:
    using Factory = ZmTypedObject* (*)();

    /// Fills the fields and registers the descriptor. \p name is not copied: it must outlive the
    /// descriptor. A name already present is inserted after the existing entries.
    ZmTypeInfo(const char* name, Factory factory, const ZmTypeInfo* parent1, const ZmTypeInfo* parent2);
    /// A search key: the name only, not registered.
    explicit ZmTypeInfo(const char* name);
    ZmTypeInfo(const ZmTypeInfo&) = delete;
    ZmTypeInfo& operator=(const ZmTypeInfo&) = delete;
    /// Removes this descriptor (by identity) from the registry.
    ~ZmTypeInfo();

    const char* getName() const { return m_name; }
    /// 1 when there is a factory.
    int canCreateInstance() const { return m_factory != nullptr ? 1 : 0; }
    /// A new object from the factory, or null without one.
    ZmTypedObject* createInstance() const { return m_factory != nullptr ? m_factory() : nullptr; }
    /// (2 when the second parent is set, else 1) minus (1 when the first is null): a descriptor
    /// with only a second parent reports 1. Callers always fill the first parent first.
    int getNumParents() const { return (m_parent2 != nullptr ? 2 : 1) - (m_parent1 == nullptr ? 1 : 0); }
    /// Parent 0 or 1; unchecked.
    const ZmTypeInfo* getParent(int i) const { return i == 0 ? m_parent1 : m_parent2; }
    /// 1 when this is \p t or a parent is, recursively.
    int isOfType(const ZmTypeInfo* t) const;

    /// The registry, sorted by name.
    static ZmDArray<ZmTypeInfo*>& allTypes();
    /// The registered descriptor of that name, or null (any one of several equal names).
    static ZmTypeInfo* fromName(const char* name);
    /// Removes the registered descriptor of that name, if any.
    static void removeType(const char* name);

private:
    const char* m_name = nullptr;
    Factory m_factory = nullptr;
    const ZmTypeInfo* m_parent1 = nullptr;
    const ZmTypeInfo* m_parent2 = nullptr;
    /// Search keys never enter the registry, so their destruction need not scan it.
    bool m_registered = false;
};
