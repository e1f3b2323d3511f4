/// \file
/// The base of objects that carry a run-time type descriptor.
#pragma once

#include <zmlib/ZmExport.h>
#include <zmlib/ZmTypeInfo.h>

/// An object that knows its `ZmTypeInfo`.
///
/// Every typed class follows one pattern: a static `getClassTypeId()` that builds the class's
/// descriptor on first call (name, factory, the parents' `getClassTypeId()`), a static
/// `initClass()` that just calls it, and `getTypeId()` returning it. `ZM_TYPED_OBJECT` and
/// `ZM_TYPED_OBJECT_IMPL` write that pattern.
class ZMLIB_API ZmTypedObject {
public:
    virtual const ZmTypeInfo* getTypeId() const;
    virtual ~ZmTypedObject();

    /// The descriptor "ZmTypedObject": no factory, no parents.
    static const ZmTypeInfo* getClassTypeId();
    static void initClass();
    /// getTypeId()->isOfType(t).
    int isOfType(const ZmTypeInfo* t) const { return getTypeId()->isOfType(t); }
};

/// Declares the typed-class members inside a class derived from `ZmTypedObject`.
#define ZM_TYPED_OBJECT                                                                                      \
public:                                                                                                      \
    static const ZmTypeInfo* getClassTypeId();                                                               \
    static void initClass()                                                                                  \
    {                                                                                                        \
        getClassTypeId();                                                                                    \
    }                                                                                                        \
    const ZmTypeInfo* getTypeId() const override                                                             \
    {                                                                                                        \
        return getClassTypeId();                                                                             \
    }

/// Defines `getClassTypeId()` for \p Class with its \p factory (or nullptr) and parents (the
/// second may be nullptr).
#define ZM_TYPED_OBJECT_IMPL(Class, factory, Parent1, Parent2)                                               \
    const ZmTypeInfo* Class::getClassTypeId()                                                                \
    {                                                                                                        \
        static const ZmTypeInfo type(#Class, factory, Parent1::getClassTypeId(), Parent2);                   \
        return &type;                                                                                        \
    }
