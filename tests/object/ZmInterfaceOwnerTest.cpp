#include <zmlib/ZmCallable.h>
#include <zmlib/ZmEditable.h>
#include <zmlib/ZmEditingListener.h>
#include <zmlib/ZmHandable.h>
#include <zmlib/ZmHandle.h>
#include <zmlib/ZmInterface.h>
#include <zmlib/ZmInterfaceOwner.h>
#include <zmlib/ZmInterfaceOwnerDefaultImpl.h>

#include <gtest/gtest.h>

#include <climits>
#include <initializer_list>
#include <string>
#include <utility>
#include <vector>

namespace {

using Log = std::vector<std::string>;
using Policy = ZmInterfaceOwner::MemoryPolicy;
constexpr Policy kStatic = ZmInterfaceOwner::StaticMemory, kManaged = ZmInterfaceOwner::ManageMemory;

/// Logs its deletion. When given the owner, it also checks that the owner no longer hands out
/// registered interfaces while tearing down (a lookup then answers the owner itself).
struct Probe {
    Log* log = nullptr;
    std::string tag;
    ZmInterfaceOwner* lookupOwner = nullptr;
    ~Probe()
    {
        if (log == nullptr) {
            return;
        }
        const bool stale = lookupOwner != nullptr &&
                           lookupOwner->getInterface(ZmTypedObject::getClassTypeId()) != lookupOwner;
        log->push_back(tag + (stale ? " (saw a stale registration)" : ""));
    }
};

class IoA : public ZmInterface {
    ZM_TYPED_OBJECT
    IoA() = default; // managed by a fresh default owner
    IoA(ZmInterfaceOwner* owner, Policy policy, Log* log = nullptr, std::string tag = "", bool probe = false)
        : ZmInterface(owner, policy), m_probe{log, std::move(tag), probe ? getOwner() : nullptr}
    {}
    Probe m_probe;
};

class IoB : public IoA {
    ZM_TYPED_OBJECT
    using IoA::IoA;
};

/// A typed object that is not a `ZmInterface`: registered with the owner by hand.
class IoPlain : public ZmTypedObject {
    ZM_TYPED_OBJECT
    IoPlain(Log* log, std::string tag, ZmInterfaceOwner* lookupOwner = nullptr)
        : m_probe{log, std::move(tag), lookupOwner}
    {}
    Probe m_probe;
};

class IoOwner : public ZmInterfaceOwnerDefaultImpl {
    ZM_TYPED_OBJECT
    explicit IoOwner(Log* log) : m_log(log) {}

protected:
    ~IoOwner() override { m_log->push_back("owner"); }

private:
    Log* m_log;
};

class IoHeld : public ZmHandable {
public:
    IoHeld(Log* log, std::string tag) : m_probe{log, std::move(tag), nullptr} {}
    Probe m_probe;
};

ZM_TYPED_OBJECT_IMPL(IoA, nullptr, ZmInterface, nullptr)
ZM_TYPED_OBJECT_IMPL(IoB, nullptr, IoA, nullptr)
ZM_TYPED_OBJECT_IMPL(IoPlain, nullptr, ZmTypedObject, nullptr)
ZM_TYPED_OBJECT_IMPL(IoOwner, nullptr, ZmInterfaceOwner, nullptr)

struct AttachContext {
    ZmInterfaceOwner* owner = nullptr;
    int calls = 0;
    ZmTypedObject* attached = nullptr;
    ZmTypedObject* nested = nullptr;
};

void attachOnce(void* data)
{
    auto* c = static_cast<AttachContext*>(data);
    ++c->calls;
    c->attached = new IoB(c->owner, kManaged);
    c->nested = c->owner->getInterface(IoB::getClassTypeId()); // must not run the callback again
}

} // namespace

TEST(ZmInterfaceOwner, LaterRegistrationsShadowEarlierOnesAndTheOwnerAnswersForItself)
{
    Log log;
    const ZmHandle<IoOwner> owner(new IoOwner(&log));
    ZmInterfaceOwner* o = owner.get();
    IoA a1(o, kStatic);
    IoB b1(o, kStatic);
    IoPlain c1(nullptr, "");
    o->registerInterfaceStaticMemory(&c1);
    IoA a2(o, kStatic);
    EXPECT_EQ(o->getInterface(IoA::getClassTypeId()), &a2);
    EXPECT_EQ(o->getInterface(IoB::getClassTypeId()), &b1);
    EXPECT_EQ(o->getInterface(IoPlain::getClassTypeId()), &c1);
    EXPECT_EQ(o->getInterface(ZmTypedObject::getClassTypeId()), &a2); // by a parent type
    EXPECT_EQ(o->getInterface(ZmInterfaceOwner::getClassTypeId()), o);
    EXPECT_EQ(o->getInterface(nullptr), nullptr);
    EXPECT_EQ(a1.getInterface(IoPlain::getClassTypeId()), &c1);

    ZmDArray<ZmTypedObject*> all;
    all.append(&c1); // replaced, not appended to
    a1.getAllInterfaces(all);
    const std::vector<ZmTypedObject*> expected{&a2, &c1, &b1, &a1, o};
    EXPECT_EQ(std::vector<ZmTypedObject*>(all.begin(), all.end()), expected);

    const IoA copy(a1); // a copy joins the same owner, registered last
    EXPECT_EQ(copy.getOwner(), o);
    EXPECT_EQ(o->getInterface(IoA::getClassTypeId()), &copy);
}

TEST(ZmInterfaceOwner, AttachCallbackRunsOnceBeforeTheFirstLookupAndIsNotReentered)
{
    Log log;
    const ZmHandle<IoOwner> owner(new IoOwner(&log));
    AttachContext ctx;
    ctx.owner = owner.get();
    owner->registerAttachInterfacesOnceCB(&attachOnce, &ctx);
    EXPECT_EQ(ctx.calls, 0);
    EXPECT_EQ(owner->getInterface(nullptr), nullptr); // runs the callback even for a null type
    EXPECT_EQ(ctx.calls, 1);
    EXPECT_EQ(ctx.nested, ctx.attached);
    ZmDArray<ZmTypedObject*> all;
    for (int i = 0; i < 100; ++i) {
        EXPECT_EQ(owner->getInterface(IoB::getClassTypeId()), ctx.attached);
        owner->getAllInterfaces(all);
        owner->attachInterfacesOnce();
    }
    EXPECT_EQ(ctx.calls, 1);
    EXPECT_EQ(all.size(), 2);

    ZmTypedObject* first = ctx.attached;
    owner->registerAttachInterfacesOnceCB(&attachOnce, &ctx); // armed again
    owner->attachInterfacesOnce();
    owner->getAllInterfaces(all);
    EXPECT_EQ(ctx.calls, 2);
    EXPECT_NE(ctx.attached, first);
    EXPECT_EQ(owner->getInterface(IoB::getClassTypeId()), ctx.attached);
}

TEST(ZmInterfaceOwner, TeardownDeletesManagedLastFirstThenReleasesHeldFirstFirst)
{
    Log log;
    auto* owner = new IoOwner(&log);
    IoA s1(owner, kStatic, &log, "s1");
    IoPlain s2(&log, "s2");
    owner->registerInterface(&s2, kStatic);
    new IoA(owner, kManaged, &log, "m1", true);
    owner->registerInterfaceManageMemory(new IoPlain(&log, "m2", owner));
    owner->manageMemory(new IoPlain(&log, "m3", owner));
    owner->registerInterface(new IoPlain(&log, "m4", owner), kManaged);
    auto* shared = new IoHeld(&log, "h2");
    owner->handleObject(new IoHeld(&log, "h1"));
    shared->ref();
    owner->handleObject(shared);
    owner->handleObject(new IoHeld(&log, "h3"));
    EXPECT_EQ(shared->refCount(), 2);

    owner->ref();
    owner->unref();
    EXPECT_EQ(log, (Log{"m4", "m3", "m2", "m1", "h1", "h3", "owner"}));
    EXPECT_EQ(shared->refCount(), 1); // still referenced elsewhere: released, not deleted
    shared->unref();
    EXPECT_EQ(log.back(), "h2");
}

TEST(ZmInterface, WithoutAnOwnerMakesADefaultOwnerThatDiesWithIt)
{
    Log log;
    auto* i = new IoA(nullptr, kManaged, &log, "i");
    ZmInterfaceOwner* o = i->getOwner();
    auto* counted = dynamic_cast<ZmHandable*>(o);
    ASSERT_NE(counted, nullptr);
    EXPECT_TRUE(counted->isVirgin());
    EXPECT_EQ(o->getTypeId(), ZmInterfaceOwner::getClassTypeId());
    EXPECT_EQ(i->getInterface(IoA::getClassTypeId()), i);
    EXPECT_EQ(i->getInterface(IoB::getClassTypeId()), nullptr); // neither an interface nor the owner
    new IoB(o, kManaged, &log, "c");
    i->handleObject(new IoHeld(&log, "held"));
    i->ref();
    i->ref();
    EXPECT_EQ(counted->refCount(), 2);
    i->unref();
    EXPECT_TRUE(log.empty());
    i->unref();
    EXPECT_EQ(log, (Log{"c", "i", "held"}));

    log.clear();
    (new IoA())->unref(); // default constructor: managed by a fresh owner, released at count 0
    {
        IoA onStack(nullptr, kStatic, &log, "static");
        onStack.unref(); // the owner goes; a static interface is left alone
        EXPECT_TRUE(log.empty());
    }
    EXPECT_EQ(log, (Log{"static"}));
}

namespace {

class Recorder final : public ZmEditingListener {
public:
    Recorder(Log* log, std::string name) : m_log(log), m_name(std::move(name)) {}
    void editingStarted(ZmEditable* e) override { note("+", e); }
    void editingFinished(ZmEditable* e) override { note("-", e); }
    std::vector<ZmEditable*> seen;

private:
    void note(const char* what, ZmEditable* e)
    {
        m_log->push_back(m_name + what + std::to_string(e->getEditingFlags()));
        seen.push_back(e);
    }
    Log* m_log;
    std::string m_name;
};

} // namespace

TEST(ZmEditable, ListenersHearStartAfterFlagsAreSetAndFinishBeforeTheyClearAndGoFirstOccurrenceFirst)
{
    Log log;
    Recorder l1(&log, "L1"), l2(&log, "L2"), l3(&log, "L3");
    ZmEditable e;
    e.addEditingListener(&l1);
    e.addEditingListener(&l2);
    e.addEditingListener(&l1); // duplicates are told twice
    e.startEditing(6);
    EXPECT_EQ(e.getEditingFlags(), 6);
    e.finishEditing();
    EXPECT_EQ(e.getEditingFlags(), 0);
    EXPECT_EQ(log, (Log{"L1+6", "L2+6", "L1+6", "L1-6", "L2-6", "L1-6"}));
    EXPECT_EQ(l1.seen, (std::vector<ZmEditable*>(4, &e)));

    log.clear();
    e.removeEditingListener(&l1); // the first occurrence only
    e.removeEditingListener(&l3); // absent: nothing to do
    e.startEditing(1);
    EXPECT_EQ(log, (Log{"L2+1", "L1+1"}));
    e.removeEditingListener(&l1);
    e.removeEditingListener(&l2);
    e.finishEditing();
    EXPECT_EQ(log.size(), 2u);
}

TEST(ZmEditable, IsEditedNeedsAnyBitAndIsAllEditedEveryBit)
{
    ZmEditable e;
    // isEdited and isAllEdited as two digits per mask
    const auto answers = [&e](std::initializer_list<int> masks) {
        std::string s;
        for (int m : masks) {
            s += " " + std::to_string(e.isEdited(m)) + std::to_string(e.isAllEdited(m));
        }
        return s;
    };
    EXPECT_EQ(answers({-1, 0}), " 00 01");
    e.startEditing(0b0110);
    EXPECT_EQ(answers({0b0010, 0b1100, 0b1001, 0, 0b0110, 0b0111}), " 11 10 00 01 11 10");
    e.startEditing(-1);
    EXPECT_EQ(answers({INT_MIN, -1}), " 11 11");
    e.finishEditing();
    EXPECT_EQ(answers({INT_MIN}), " 00");
}

TEST(ZmEditable, CopiesCarryFlagsAndListeners)
{
    Log log;
    Recorder l1(&log, "L1"), l2(&log, "L2");
    ZmEditable e;
    e.addEditingListener(&l1);
    e.startEditing(5);
    ZmEditable copy(e);
    ZmEditable assigned;
    assigned.addEditingListener(&l2);
    assigned = e;
    log.clear();
    copy.finishEditing();
    assigned.finishEditing(); // its own listener was replaced, not kept
    EXPECT_EQ(log, (Log{"L1-5", "L1-5"}));
    EXPECT_EQ(e.getEditingFlags(), 5) << "the source keeps its own state";
}

TEST(ZmCallable, CallOperatorInvokesCall)
{
    struct Counter : ZmCallable {
        int calls = 0;
        void call() override { ++calls; }
    } counter;
    ZmCallable& f = counter;
    f();
    f();
    EXPECT_EQ(counter.calls, 2);
}
