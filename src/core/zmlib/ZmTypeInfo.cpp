#include <zmlib/ZmTypeInfo.h>

#include <cstring>

namespace {

int compareNames(ZmTypeInfo* const& a, ZmTypeInfo* const& b)
{
    // strcmp compares as unsigned characters, which is the registry's order.
    return std::strcmp(a->getName(), b->getName());
}

} // namespace

ZmDArray<ZmTypeInfo*>& ZmTypeInfo::allTypes()
{
    // Never destroyed: descriptors of other modules may be destroyed after this library's statics,
    // and each removes itself from the registry.
    static auto* registry = new ZmDArray<ZmTypeInfo*>();
    return *registry;
}

ZmTypeInfo::ZmTypeInfo(const char* name, Factory factory, const ZmTypeInfo* parent1,
                       const ZmTypeInfo* parent2)
    : m_name(name), m_factory(factory), m_parent1(parent1), m_parent2(parent2), m_registered(true)
{
    ZmTypeInfo* self = this;
    allTypes().insertSorted(self, compareNames);
}

ZmTypeInfo::ZmTypeInfo(const char* name) : m_name(name)
{}

ZmTypeInfo::~ZmTypeInfo()
{
    if (!m_registered) {
        return;
    }
    ZmDArray<ZmTypeInfo*>& types = allTypes();
    const int64_t at = types.index(this);
    if (at >= 0) {
        types.remove(at, 1);
    }
}

int ZmTypeInfo::isOfType(const ZmTypeInfo* t) const
{
    if (this == t) {
        return 1;
    }
    if (m_parent1 != nullptr && m_parent1->isOfType(t)) {
        return 1;
    }
    return m_parent2 != nullptr && m_parent2->isOfType(t) ? 1 : 0;
}

ZmTypeInfo* ZmTypeInfo::fromName(const char* name)
{
    ZmTypeInfo key(name);
    ZmDArray<ZmTypeInfo*>& types = allTypes();
    const int64_t at = types.findSorted(&key, compareNames);
    return at >= 0 ? types[at] : nullptr;
}

void ZmTypeInfo::removeType(const char* name)
{
    ZmTypeInfo key(name);
    ZmDArray<ZmTypeInfo*>& types = allTypes();
    const int64_t at = types.findSorted(&key, compareNames);
    if (at >= 0) {
        types.remove(at, 1);
    }
}
