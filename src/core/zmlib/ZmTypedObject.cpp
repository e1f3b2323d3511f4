#include <zmlib/ZmTypedObject.h>

const ZmTypeInfo* ZmTypedObject::getClassTypeId()
{
    static const ZmTypeInfo type("ZmTypedObject", nullptr, nullptr, nullptr);
    return &type;
}

void ZmTypedObject::initClass()
{
    getClassTypeId();
}

const ZmTypeInfo* ZmTypedObject::getTypeId() const
{
    return getClassTypeId();
}

ZmTypedObject::~ZmTypedObject() = default;
