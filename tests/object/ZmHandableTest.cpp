#include <zmlib/ZmHandable.h>
#include <zmlib/ZmHandableThreaded.h>
#include <zmlib/ZmHandle.h>

#include <gtest/gtest.h>

#include <atomic>
#include <functional>
#include <string>
#include <thread>
#include <type_traits>
#include <utility>
#include <vector>

namespace {

using Events = std::vector<std::string>;

/// Count and flags in one text, e.g. "2", "0 virgin", "0 dying dtorCalled".
template <class H>
std::string state(const H& o)
{
    std::string s = std::to_string(o.refCount());
    s += o.isVirgin() ? " virgin" : "";
    s += o.isDestructionInProgress() ? " dying" : "";
    if constexpr (std::is_base_of_v<ZmHandable, H>) {
        s += o.isDestructorCalled() ? " dtorCalled" : "";
    }
    return s;
}

/// Counts its instances and logs its teardown with its state at that moment into a log that
/// outlives it. The destructor is public so that copies can live on the stack.
template <class Base>
class Counted : public Base {
public:
    inline static int alive = 0;
    explicit Counted(Events* log = nullptr) : m_log(log) { ++alive; }
    Counted(const Counted& o) : Base(o), m_log(o.m_log) { ++alive; }
    Counted& operator=(const Counted&) = default;
    ~Counted() override
    {
        --alive;
        note("destructor");
    }
    void note(const char* what)
    {
        if (m_log != nullptr) {
            m_log->push_back(what + (" " + state(*this)));
        }
    }
    std::function<void(Counted&)> onNotify;

protected:
    void notifyDelete() override
    {
        Base::notifyDelete(); // the base's own teardown does nothing, and must not throw or delete
        note("notify");
        if (onNotify) {
            onNotify(*this);
        }
    }

private:
    Events* m_log;
};

using Single = Counted<ZmHandable>;
using Threaded = Counted<ZmHandableThreaded>;

template <class H>
void refTimes(H* o, int n)
{
    for (int i = 0; i < n; ++i) {
        o->ref();
    }
}

/// Copy construction and assignment between objects at counts 2 and 1: "copy|assigned|source".
template <class H>
std::string countsAfterCopies()
{
    H a, c;
    refTimes(&a, 2);
    c.ref();
    const H b(a);
    c = a;
    return state(b) + "|" + state(c) + "|" + state(a);
}

} // namespace

TEST(ZmHandable, UnrefDeletesBelowOneWhileUnrefNoDeleteNeverDeletes)
{
    Events log;
    (new Single(&log))->unref(); // never referenced: the count drops to -1, below 1
    EXPECT_EQ(log, (Events{"notify -1 dying", "destructor -1 dying dtorCalled"}));
    log.clear();
    auto* o = new Single(&log);
    EXPECT_EQ(state(*o), "0 virgin");
    o->unrefNoDelete(); // not even from 0
    EXPECT_EQ(state(*o), "-1");
    refTimes(o, 4);
    o->unref();
    o->unref();
    EXPECT_EQ(state(*o), "1");
    o->unrefNoDelete(); // 1 -> 0
    EXPECT_EQ(state(*o), "0 virgin");
    EXPECT_TRUE(log.empty());
    o->ref();
    o->unref();
    EXPECT_EQ(log, (Events{"notify 0 dying", "destructor 0 dying dtorCalled"}));
    log.clear();
    delete new Single(&log); // deleted directly: the derived destructor can tell
    EXPECT_EQ(log, (Events{"destructor 0 virgin"}));
    EXPECT_EQ(Single::alive, 0);
}

TEST(ZmHandable, ReferencesTakenOrDroppedInsideNotifyDeleteAreIgnored)
{
    Events log;
    auto* o = new Single(&log);
    o->onNotify = [&](Single& self) {
        refTimes(&self, 2);
        self.unref();
        self.unrefNoDelete();
        self.unref();
        {
            const ZmHandle<Single> h(&self);
        }
        self.note("after nested");
        const Single copy(self); // an ordinary fresh object, logged when it goes
    };
    o->ref();
    o->unref();
    EXPECT_EQ(log, (Events{"notify 0 dying", "after nested 0 dying", "destructor 0 virgin",
                           "destructor 0 dying dtorCalled"}));
    EXPECT_EQ(Single::alive, 0);
}

TEST(ZmHandable, CopiesStartAtZeroAndAssignmentKeepsTheCount)
{
    EXPECT_EQ(countsAfterCopies<Single>(), "0 virgin|1|2");
    EXPECT_EQ(countsAfterCopies<Threaded>(), "0 virgin|1|2");
}

TEST(ZmHandableThreaded, OnlyTheExactDropToZeroDeletesAndOnlyOnce)
{
    Events log;
    auto* o = new Threaded(&log);
    o->unref(); // unlike ZmHandable: a fresh object stays alive at -1
    EXPECT_EQ(state(*o), "-1");
    o->unref(); // a negative count never deletes
    refTimes(o, 3);
    o->unrefNoDelete();
    EXPECT_EQ(state(*o), "0 virgin");
    EXPECT_TRUE(log.empty());
    o->onNotify = [](Threaded& self) {
        self.ref();
        self.unref(); // back at the deletion mark, far from 0
        {
            const ZmHandle<Threaded> h(&self);
        }
        self.note("after nested");
    };
    refTimes(o, 2);
    o->unref();
    EXPECT_TRUE(log.empty());
    o->unref(); // exactly 1 -> 0
    EXPECT_EQ(log, (Events{"notify 0 dying", "after nested 0 dying", "destructor 0 dying"}));
    EXPECT_EQ(Threaded::alive, 0);
}

TEST(ZmHandle, CountsCopiesMovesAssignmentsAndConvertedViewsAndReleasesOnce)
{
    Events log;
    auto* o = new Single(&log);
    {
        ZmHandle<Single> h(o);
        ZmHandle<Single> copy(h);
        ZmHandle<Single> moved(std::move(copy));
        EXPECT_EQ(state(*o), "2");
        EXPECT_FALSE(copy); // NOLINT(bugprone-use-after-move): a moved-from handle is empty
        ZmHandle<Single> assigned;
        assigned = h;
        EXPECT_EQ(&*assigned, o);
        const ZmHandle<const ZmHandable> constBase(ZmHandle<const Single>{h});
        EXPECT_EQ(state(*o), "4");
        assigned = nullptr;
        moved.release();
        EXPECT_EQ(state(*o), "2");
        ZmHandle<Single>& alias = h;
        h = alias;
        h = h.get(); // referenced before the old reference goes
        h.reset(h.get());
        h = std::move(alias);
        EXPECT_EQ(state(*h), "2");
        EXPECT_TRUE(log.empty());
    }
    EXPECT_EQ(log.size(), 2u);
    log.clear();

    ZmHandle<Single> first(new Single(&log)), second(new Single);
    Single* secondObject = second.get();
    first = std::move(second); // the first object goes with the last handle involved
    EXPECT_EQ(log.size(), 2u);
    EXPECT_EQ(first.get(), secondObject);
    EXPECT_EQ(state(*first), "1");
    second.release(); // NOLINT(bugprone-use-after-move)
    first.release();
    ZmHandle<const Threaded> t(new Threaded(&log));
    ZmHandle<const ZmHandableThreaded> tb(t);
    EXPECT_EQ(state(*t), "2");
    t.release();
    tb.release(); // 1 -> 0: deleted by its last handle
    EXPECT_EQ(log.size(), 4u);
    EXPECT_EQ(Single::alive + Threaded::alive, 0);
}

// Several threads hammer shared objects with ref/unref pairs while each holds one reference, then
// drop their references: each object must be deleted exactly once, and only when nobody holds it.
namespace {

// kStaggered objects are dropped at different moments while other threads still ref/unref them;
// kTogether objects are dropped by all threads at once, one object after each barrier.
constexpr int kThreads = 4, kStaggered = 8, kTogether = 64, kAll = kStaggered + kTogether;
constexpr int kRounds = 300, kPairs = 40;

struct Tally {
    std::atomic<int> deletions[kAll] = {};
    std::atomic<int> errors{0};
};

class Shared : public ZmHandableThreaded {
public:
    Shared(Tally* t, int id) : m_tally(t), m_id(id) {}
    /// Gives up this thread's own reference.
    void drop()
    {
        --m_holders;
        unref();
    }

protected:
    ~Shared() override
    {
        m_tally->errors += m_holders.load() != 0;
        ++m_tally->deletions[m_id];
    }
    void notifyDelete() override
    {
        m_tally->errors += refCount() != 0 || !isDestructionInProgress() || m_holders.load() != 0;
    }

private:
    Tally* m_tally;
    int m_id;
    std::atomic<int> m_holders{kThreads}; // threads that still hold their reference
};

/// A reusable barrier: every thread's n-th call returns once all threads have made it.
void arrive(std::atomic<int>& gate, int n)
{
    ++gate;
    while (gate.load() < n * kThreads) {
        std::this_thread::yield();
    }
}

} // namespace

TEST(ZmHandableThreaded, ConcurrentRefUnrefDeletesEveryObjectOnceAndNeverWhileHeld)
{
    for (int round = 0; round < kRounds; ++round) {
        Tally tally;
        std::vector<Shared*> objects;
        for (int i = 0; i < kAll; ++i) {
            objects.push_back(new Shared(&tally, i));
            refTimes(objects.back(), kThreads);
        }
        std::atomic<int> gate{0};
        std::vector<std::thread> threads;
        for (int t = 0; t < kThreads; ++t) {
            threads.emplace_back([&, t] {
                arrive(gate, 1);
                for (int k = 0; k < kStaggered; ++k) {
                    Shared* o = objects[(k + t * 2) % kStaggered];
                    for (int p = 0; p < kPairs; ++p) {
                        o->ref();
                        o->unref();
                    }
                    o->drop();
                }
                for (int k = kStaggered; k < kAll; ++k) {
                    arrive(gate, 2 + k - kStaggered);
                    objects[k]->drop();
                }
            });
        }
        for (auto& th : threads) {
            th.join();
        }
        ASSERT_EQ(tally.errors.load(), 0) << "round " << round;
        for (int i = 0; i < kAll; ++i) {
            ASSERT_EQ(tally.deletions[i].load(), 1) << "round " << round << " object " << i;
        }
    }
}
