// Failure injection for the tests: the Nth heap request of the library fails, and an element type
// whose copy throws. Both let a test walk every failure point of an operation and check that the
// object comes out as its contract says (ASan reports what leaks or is freed twice).
#pragma once

#include <zmlib/ZmMemory.h>
#include <zmlib/ZmMemoryException.h>

#include <gtest/gtest.h>

#include <atomic>
#include <cstdint>
#include <stdexcept>

/// While alive, heap request number \p n of zmmalloc/zmrealloc (1-based, counted from
/// construction) fails, and with \p sticky every later one too. One at a time (not nested).
class FailAllocation {
public:
    explicit FailAllocation(int64_t n, bool sticky = false)
    {
        counters().seen = 0;
        counters().failed = 0;
        counters().failAt = n;
        counters().sticky = sticky;
        m_previous = zmSetAllocationFailureHook(&hook);
    }
    ~FailAllocation() { zmSetAllocationFailureHook(m_previous); }
    FailAllocation(const FailAllocation&) = delete;
    FailAllocation& operator=(const FailAllocation&) = delete;

    /// Requests refused so far.
    static int64_t failed() { return counters().failed; }

private:
    struct Counters {
        std::atomic<int64_t> seen{0};
        std::atomic<int64_t> failed{0};
        std::atomic<int64_t> failAt{0};
        std::atomic<bool> sticky{false};
    };
    static Counters& counters()
    {
        static Counters c;
        return c;
    }
    static bool hook(uint64_t)
    {
        Counters& c = counters();
        const int64_t n = ++c.seen;
        if (n == c.failAt || (c.sticky && n > c.failAt)) {
            ++c.failed;
            return true;
        }
        return false;
    }

    ZmAllocationFailureHook m_previous = nullptr;
};

/// What a walk over the failure points of an operation saw.
struct FailureWalk {
    int64_t thrown = 0;   ///< runs that ended in ZmMemoryException
    int64_t absorbed = 0; ///< runs that saw a refused request and still returned normally
};

/// Runs \p op with its 1st, 2nd, ... heap request failing until a run makes fewer requests than
/// the one refused (every failure point has been visited). After each run that saw a failure,
/// \p check(n, threw) tests the state the operation left. Anything thrown other than
/// ZmMemoryException fails the test.
template <class Op, class Check>
FailureWalk walkAllocationFailures(Op op, Check check)
{
    FailureWalk walk;
    for (int64_t n = 1; n < 100000; ++n) {
        bool threw = false;
        bool injected = false;
        {
            const FailAllocation fail(n);
            try {
                op();
            } catch (const ZmMemoryException&) {
                threw = true;
            }
            injected = FailAllocation::failed() > 0;
        }
        if (!injected) {
            return walk;
        }
        ++(threw ? walk.thrown : walk.absorbed);
        check(n, threw);
    }
    ADD_FAILURE() << "the operation never ran out of heap requests to fail";
    return walk;
}

/// An element whose copy (construction or assignment) throws once a process-wide budget of copies
/// is spent. It owns a heap cell, so a copy destroyed twice or never is an ASan report, and it
/// counts the live objects.
class ThrowingCopy {
public:
    struct CopyFailed : std::runtime_error {
        CopyFailed() : std::runtime_error("copy failed") {}
    };

    ThrowingCopy() : ThrowingCopy(0) {}
    ThrowingCopy(int v) : m_value(new int(v)) { ++live(); } // NOLINT: implicit on purpose
    ThrowingCopy(const ThrowingCopy& other) : m_value((spend(), new int(*other.m_value))) { ++live(); }
    ThrowingCopy& operator=(const ThrowingCopy& other)
    {
        spend();
        *m_value = *other.m_value;
        return *this;
    }
    ~ThrowingCopy()
    {
        delete m_value;
        --live();
    }

    int value() const { return *m_value; }
    bool operator==(const ThrowingCopy& other) const { return *m_value == *other.m_value; }

    /// Copies allowed before the next one throws; negative: unlimited.
    static int& budget()
    {
        static int b = -1;
        return b;
    }
    /// Objects constructed and not yet destroyed.
    static int& live()
    {
        static int n = 0;
        return n;
    }

private:
    static void spend()
    {
        if (budget() == 0) {
            throw CopyFailed();
        }
        if (budget() > 0) {
            --budget();
        }
    }

    int* m_value;
};
