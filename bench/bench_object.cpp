// Reference counting of the object model against the smart pointers a user would otherwise pick.
// Every case takes one more reference to an object that stays alive and drops it again, on one
// thread: the cost of handing an object to a holder and back, without contention.

#include "zmbench.h"

#include <zmlib/ZmHandable.h>
#include <zmlib/ZmHandableThreaded.h>

#include <boost/smart_ptr/intrusive_ptr.hpp>
#include <boost/smart_ptr/intrusive_ref_counter.hpp>

#include <memory>

namespace {

class ThreadedObject : public ZmHandableThreaded {
public:
    int payload = 0;
};

class SingleObject : public ZmHandable {
public:
    int payload = 0;
};

struct Payload {
    int payload = 0;
};

// --- ZmHandableThreaded ref/unref -----------------------------------------------------------------

ZMBENCH_REPORTED("ZmHandableThreaded_refUnref",
                 "One `ref()` + `unref()` pair on a `ZmHandableThreaded` object that stays referenced (an "
                 "atomic increment, then the spin lock around the atomic decrement) vs copying and dropping "
                 "a `std::shared_ptr` (two atomic operations on the control block) and a "
                 "`boost::intrusive_ptr` with a thread-safe counter. Uncontended, one thread.");

void ThreadedRefUnrefZm(benchmark::State& state)
{
    auto* object = new ThreadedObject;
    object->ref();
    for (auto _ : state) {
        object->ref();
        benchmark::DoNotOptimize(object);
        object->unref();
        benchmark::ClobberMemory();
    }
    object->unref();
    state.SetLabel("ZmHandableThreaded::ref + unref");
}
BENCHMARK(ThreadedRefUnrefZm)->Name("ZmHandableThreaded_refUnref/zm");

void ThreadedRefUnrefPeer(benchmark::State& state)
{
    const auto object = std::make_shared<Payload>();
    for (auto _ : state) {
        {
            std::shared_ptr<Payload> copy(object);
            benchmark::DoNotOptimize(copy);
        }
        benchmark::ClobberMemory();
    }
    state.SetLabel("std::shared_ptr copy + drop");
}
BENCHMARK(ThreadedRefUnrefPeer)->Name("ZmHandableThreaded_refUnref/peer");

struct SafeCounted : boost::intrusive_ref_counter<SafeCounted, boost::thread_safe_counter> {
    int payload = 0;
};

void ThreadedRefUnrefIntrusive(benchmark::State& state)
{
    const boost::intrusive_ptr<SafeCounted> object(new SafeCounted);
    for (auto _ : state) {
        {
            boost::intrusive_ptr<SafeCounted> copy(object);
            benchmark::DoNotOptimize(copy);
        }
        benchmark::ClobberMemory();
    }
    state.SetLabel("boost::intrusive_ptr (thread_safe_counter) copy + drop");
}
BENCHMARK(ThreadedRefUnrefIntrusive)->Name("ZmHandableThreaded_refUnref/peer-intrusive");

// --- ZmHandable ref/unref -------------------------------------------------------------------------

ZMBENCH_REPORTED(
    "ZmHandable_refUnref",
    "One `ref()` + `unref()` pair on a single-threaded `ZmHandable` object that stays referenced "
    "(plain increment and decrement, inline) vs copying and dropping a `boost::intrusive_ptr` "
    "with a thread-unsafe counter.");

void SingleRefUnrefZm(benchmark::State& state)
{
    auto* object = new SingleObject;
    object->ref();
    for (auto _ : state) {
        object->ref();
        benchmark::DoNotOptimize(object);
        object->unref();
        benchmark::ClobberMemory();
    }
    object->unref();
    state.SetLabel("ZmHandable::ref + unref");
}
BENCHMARK(SingleRefUnrefZm)->Name("ZmHandable_refUnref/zm");

struct UnsafeCounted : boost::intrusive_ref_counter<UnsafeCounted, boost::thread_unsafe_counter> {
    int payload = 0;
};

void SingleRefUnrefPeer(benchmark::State& state)
{
    const boost::intrusive_ptr<UnsafeCounted> object(new UnsafeCounted);
    for (auto _ : state) {
        {
            boost::intrusive_ptr<UnsafeCounted> copy(object);
            benchmark::DoNotOptimize(copy);
        }
        benchmark::ClobberMemory();
    }
    state.SetLabel("boost::intrusive_ptr (thread_unsafe_counter) copy + drop");
}
BENCHMARK(SingleRefUnrefPeer)->Name("ZmHandable_refUnref/peer");

} // namespace
