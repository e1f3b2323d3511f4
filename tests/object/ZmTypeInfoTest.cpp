#include <zmlib/ZmInterface.h>
#include <zmlib/ZmInterfaceOwner.h>
#include <zmlib/ZmTypeInfo.h>
#include <zmlib/ZmTypedObject.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <list>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace {

// A small hierarchy written with the library's pattern: a dog is both an animal and a pet.
class TiAnimal : public ZmTypedObject {
    ZM_TYPED_OBJECT
};
class TiPet : public ZmTypedObject {
    ZM_TYPED_OBJECT
};
class TiDog : public TiAnimal, public TiPet {
    ZM_TYPED_OBJECT
    static ZmTypedObject* create() { return static_cast<TiAnimal*>(new TiDog); }
};
class TiPuppy : public TiDog {
    ZM_TYPED_OBJECT
};

ZM_TYPED_OBJECT_IMPL(TiAnimal, nullptr, ZmTypedObject, nullptr)
ZM_TYPED_OBJECT_IMPL(TiPet, nullptr, ZmTypedObject, nullptr)
ZM_TYPED_OBJECT_IMPL(TiDog, &TiDog::create, TiAnimal, TiPet::getClassTypeId())
ZM_TYPED_OBJECT_IMPL(TiPuppy, nullptr, TiDog, nullptr)

/// Byte-wise order of unsigned characters, written independently of the library.
bool unsignedLess(const char* a, const char* b)
{
    const auto* ua = reinterpret_cast<const unsigned char*>(a);
    const auto* ub = reinterpret_cast<const unsigned char*>(b);
    return std::lexicographical_compare(ua, ua + std::strlen(a), ub, ub + std::strlen(b));
}

/// The registered entries whose name starts with \p prefix, in registry order.
std::vector<ZmTypeInfo*> entriesWithPrefix(const char* prefix)
{
    std::vector<ZmTypeInfo*> out;
    for (ZmTypeInfo* t : ZmTypeInfo::allTypes()) {
        if (std::strncmp(t->getName(), prefix, std::strlen(prefix)) == 0) {
            out.push_back(t);
        }
    }
    return out;
}

std::vector<std::string> namesWithPrefix(const char* prefix)
{
    std::vector<std::string> out;
    for (ZmTypeInfo* t : entriesWithPrefix(prefix)) {
        out.emplace_back(t->getName());
    }
    return out;
}

bool registrySorted()
{
    const ZmDArray<ZmTypeInfo*>& all = ZmTypeInfo::allTypes();
    return std::is_sorted(all.begin(), all.end(), [](ZmTypeInfo* x, ZmTypeInfo* y) {
        return unsignedLess(x->getName(), y->getName());
    });
}

} // namespace

TEST(ZmTypeInfo, RegistryIsSortedByUnsignedBytes)
{
    TiPuppy::initClass(); // some real descriptors around ours
    const int64_t before = ZmTypeInfo::allTypes().size();
    {
        std::list<ZmTypeInfo> types;
        for (const char* n : {"tiz\x80", "tizA", "tiz", "tiz\xc3\xa9", "tiza", "tiz\x7f", "tizB"}) {
            types.emplace_back(n, nullptr, nullptr, nullptr);
        }
        EXPECT_EQ(namesWithPrefix("tiz"), (std::vector<std::string>{"tiz", "tizA", "tizB", "tiza", "tiz\x7f",
                                                                    "tiz\x80", "tiz\xc3\xa9"}));
        EXPECT_TRUE(registrySorted());
        for (const ZmTypeInfo& t : types) {
            EXPECT_EQ(ZmTypeInfo::fromName(t.getName()), &t) << t.getName();
        }
    }
    EXPECT_EQ(ZmTypeInfo::allTypes().size(), before);
    EXPECT_TRUE(namesWithPrefix("tiz").empty());
}

TEST(ZmTypeInfo, DuplicateNamesStayRegisteredInOrderAndLeaveByIdentity)
{
    std::optional<ZmTypeInfo> first, second, neighbour;
    neighbour.emplace("tidupa", nullptr, nullptr, nullptr);
    first.emplace("tidup", nullptr, nullptr, nullptr);
    second.emplace("tidup", nullptr, nullptr, nullptr);
    EXPECT_EQ(entriesWithPrefix("tidup"), (std::vector<ZmTypeInfo*>{&*first, &*second, &*neighbour}));
    ZmTypeInfo* found = ZmTypeInfo::fromName("tidup");
    EXPECT_TRUE(found == &*first || found == &*second);

    first.reset(); // removes itself, not the other descriptor of the same name
    EXPECT_EQ(entriesWithPrefix("tidup"), (std::vector<ZmTypeInfo*>{&*second, &*neighbour}));
    EXPECT_EQ(ZmTypeInfo::fromName("tidup"), &*second);
    second.reset();
    EXPECT_EQ(ZmTypeInfo::fromName("tidup"), nullptr);
    EXPECT_EQ(ZmTypeInfo::fromName("tidupa"), &*neighbour);
}

TEST(ZmTypeInfo, FromNameRemoveTypeAndSearchKeys)
{
    const int64_t before = ZmTypeInfo::allTypes().size();
    EXPECT_EQ(ZmTypeInfo::fromName("tirm-absent"), nullptr);
    {
        const ZmTypeInfo key("tirm");
        EXPECT_EQ(ZmTypeInfo::allTypes().size(), before); // a key is never registered
        EXPECT_EQ(ZmTypeInfo::fromName("tirm"), nullptr);
        const ZmTypeInfo a("tirm", nullptr, nullptr, nullptr), b("tirn", nullptr, nullptr, nullptr);
        EXPECT_EQ(ZmTypeInfo::fromName("tirm"), &a);
        ZmTypeInfo::removeType("tirm");
        EXPECT_EQ(ZmTypeInfo::fromName("tirm"), nullptr);
        EXPECT_EQ(ZmTypeInfo::fromName("tirn"), &b);
        ZmTypeInfo::removeType("tirm"); // absent: nothing happens
        EXPECT_EQ(ZmTypeInfo::allTypes().size(), before + 1);
    } // a, already removed, finds nothing to remove; b removes itself
    EXPECT_EQ(ZmTypeInfo::allTypes().size(), before);
    EXPECT_EQ(ZmTypeInfo::fromName("tirn"), nullptr);
}

TEST(ZmTypeInfo, EmptyRegistryAnswersNullAndReceivesTheFirstEntry)
{
    ZmDArray<ZmTypeInfo*>& all = ZmTypeInfo::allTypes();
    const ZmDArray<ZmTypeInfo*> saved = all;
    all.clear();
    EXPECT_EQ(ZmTypeInfo::fromName("ZmTypedObject"), nullptr);
    {
        const ZmTypeInfo only("tionly", nullptr, nullptr, nullptr);
        ASSERT_EQ(all.size(), 1);
        EXPECT_EQ(all[0], &only);
        EXPECT_EQ(ZmTypeInfo::fromName("tionly"), &only);
    }
    EXPECT_EQ(all.size(), 0);
    all = saved;
}

TEST(ZmTypeInfo, ParentsAndIsOfTypeThroughBothParentsAndTwoLevels)
{
    const ZmTypeInfo root("tiRoot", nullptr, nullptr, nullptr), other("tiOther", nullptr, nullptr, nullptr);
    const ZmTypeInfo mid("tiMid", nullptr, &root, nullptr), leaf("tiLeaf", nullptr, &mid, nullptr);
    const ZmTypeInfo mixed("tiMixed", nullptr, &mid, &other), onlySecond("tiOnly2", nullptr, nullptr, &other);
    EXPECT_EQ(root.getNumParents(), 0);
    EXPECT_EQ(mid.getNumParents(), 1);
    EXPECT_EQ(mixed.getNumParents(), 2);
    EXPECT_EQ(onlySecond.getNumParents(), 1); // deliberate shortcut: callers fill the first parent first
    EXPECT_EQ(mixed.getParent(0), &mid);
    EXPECT_EQ(mixed.getParent(1), &other);
    EXPECT_EQ(onlySecond.getParent(0), nullptr);

    EXPECT_EQ(leaf.isOfType(&leaf), 1);
    EXPECT_EQ(leaf.isOfType(&root), 1);
    EXPECT_EQ(mixed.isOfType(&root), 1);
    EXPECT_EQ(mixed.isOfType(&other), 1);
    EXPECT_EQ(onlySecond.isOfType(&other), 1);
    EXPECT_EQ(root.isOfType(&leaf), 0);
    EXPECT_EQ(leaf.isOfType(&other), 0);
    EXPECT_EQ(mixed.isOfType(&leaf), 0);
    EXPECT_EQ(leaf.isOfType(nullptr), 0);
}

TEST(ZmTypedObject, ClassPatternGivesOneDescriptorPerClassSeenThroughEveryBase)
{
    TiPuppy::initClass();
    TiPuppy::initClass();
    const ZmTypeInfo* puppy = TiPuppy::getClassTypeId();
    const ZmTypeInfo* dog = TiDog::getClassTypeId();
    EXPECT_EQ(puppy, TiPuppy::getClassTypeId());
    EXPECT_STREQ(puppy->getName(), "TiPuppy");
    EXPECT_EQ(entriesWithPrefix("TiPuppy").size(), 1u);
    EXPECT_EQ(ZmTypeInfo::fromName("TiDog"), dog);
    EXPECT_EQ(puppy->getParent(0), dog);
    EXPECT_EQ(dog->getNumParents(), 2);
    EXPECT_EQ(dog->getParent(1), TiPet::getClassTypeId());
    EXPECT_EQ(TiAnimal::getClassTypeId()->getParent(0), ZmTypedObject::getClassTypeId());

    const TiPuppy p{};
    const TiAnimal& asAnimal = p;
    const TiPet& asPet = p;
    EXPECT_EQ(asAnimal.getTypeId(), puppy);
    EXPECT_EQ(asPet.getTypeId(), puppy);
    EXPECT_EQ(asPet.isOfType(TiAnimal::getClassTypeId()), 1);
    EXPECT_EQ(asAnimal.isOfType(TiPet::getClassTypeId()), 1);
    EXPECT_EQ(asAnimal.isOfType(ZmTypedObject::getClassTypeId()), 1);
    const TiAnimal animal{};
    EXPECT_EQ(animal.isOfType(dog), 0);
    EXPECT_EQ(animal.isOfType(TiPet::getClassTypeId()), 0);

    EXPECT_EQ(puppy->canCreateInstance(), 0); // no factory
    EXPECT_EQ(puppy->createInstance(), nullptr);
    EXPECT_EQ(dog->canCreateInstance(), 1);
    const std::unique_ptr<ZmTypedObject> made(dog->createInstance()), other(dog->createInstance());
    ASSERT_NE(made, nullptr);
    EXPECT_NE(made, other);
    EXPECT_EQ(made->getTypeId(), dog);
}

TEST(ZmTypedObject, LibraryDescriptorsAreFoundByName)
{
    ZmTypedObject::initClass();
    ZmInterfaceOwner::initClass();
    ZmInterface::initClass();
    const ZmTypeInfo* base = ZmTypedObject::getClassTypeId();
    EXPECT_EQ(ZmTypeInfo::fromName("ZmTypedObject"), base);
    EXPECT_EQ(base->getNumParents(), 0);
    EXPECT_EQ(base->canCreateInstance(), 0);
    for (const ZmTypeInfo* t : {ZmInterfaceOwner::getClassTypeId(), ZmInterface::getClassTypeId()}) {
        EXPECT_EQ(ZmTypeInfo::fromName(t->getName()), t);
        EXPECT_EQ(t->getNumParents(), 1);
        EXPECT_EQ(t->getParent(0), base);
        EXPECT_EQ(t->canCreateInstance(), 0);
    }
    EXPECT_STREQ(ZmInterfaceOwner::getClassTypeId()->getName(), "ZmInterfaceOwner");
    EXPECT_STREQ(ZmInterface::getClassTypeId()->getName(), "ZmInterface");
    EXPECT_TRUE(registrySorted());
}
