#include <zmlib/ZmDArray.h>
#include <zmlib/ZmMemory.h>
#include <zmlib/ZmString.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <initializer_list>
#include <random>
#include <string>
#include <type_traits>
#include <utility>
#include <vector>

namespace {

using IntArray = ZmDArray<int>;
using Ints = std::vector<int>;

IntArray makeInts(std::initializer_list<int> values)
{
    IntArray a;
    for (int v : values) {
        a.append(v);
    }
    return a;
}

Ints contents(const IntArray& a)
{
    return Ints(a.begin(), a.end());
}

int compareInts(const int& a, const int& b)
{
    return (a > b) - (a < b);
}

/// Counts its lifetimes and marks dead objects, so that a slot destroyed twice, assigned before it
/// was constructed, or constructed over a live object shows up in the counters.
struct Counted {
    static constexpr unsigned kAlive = 0xA11FEu;
    inline static int64_t constructed = 0, destroyed = 0, errors = 0;
    inline static Ints copyLog;

    static void reset()
    {
        constructed = destroyed = errors = 0;
        copyLog.clear();
    }
    static int64_t live() { return constructed - destroyed; }
    static void check(const Counted& c) { errors += c.magic != kAlive; }

    Counted() { ++constructed; }
    explicit Counted(int v) : value(v) { ++constructed; }
    Counted(const Counted& o) : value(o.value)
    {
        check(o);
        ++constructed;
        copyLog.push_back(o.value);
    }
    Counted& operator=(const Counted& o)
    {
        check(o);
        check(*this);
        value = o.value;
        return *this;
    }
    ~Counted()
    {
        check(*this);
        magic = 0;
        ++destroyed;
    }
    bool operator==(const Counted& o) const { return value == o.value; }

    int value = -1;
    unsigned magic = kAlive;
};

// Every element of the random program stands for an int of the model.
struct Elem {
    template <class T>
    static T make(int v)
    {
        if constexpr (std::is_same_v<T, ZmString>) {
            return ZmString(0, "v%d", v);
        } else {
            return T(v);
        }
    }
    static int value(int v) { return v; }
    static int value(const Counted& c) { return c.value; }
    static int value(const ZmString& s)
    {
        return s.getString()[0] == 'v' ? std::atoi(s.getString() + 1) : -1;
    }
    static bool isDefault(const Counted& c) { return c.value == -1 && c.magic == Counted::kAlive; }
    static bool isDefault(const ZmString& s) { return s.size() == 1 && s.getString()[0] == 0; }
};

template <class T>
int compareByValue(const T& a, const T& b)
{
    return compareInts(Elem::value(a), Elem::value(b));
}

/// A random sequence of operations on a ZmDArray<T>, checked after every step against a
/// std::vector<int> of the element values and against the documented capacity rules.
template <class T>
class RandomProgram {
public:
    explicit RandomProgram(uint32_t seed) : m_rng(seed) {}

    void run(int steps)
    {
        for (int step = 0; step < steps; ++step) {
            const int64_t prevMax = m_a.getMax();
            const std::string op = doStep();
            ASSERT_EQ(m_a.size(), size()) << "step " << step << " after " << op;
            const ZmDArray<T>& a = m_a;
            Ints values;
            for (size_t i = 0; i < m_m.size(); ++i) {
                values.push_back(Elem::value(a[i]));
            }
            ASSERT_EQ(values, m_m) << "step " << step << " after " << op;
            ASSERT_EQ(m_a.getMax(), m_max) << "step " << step << " after " << op;
            ASSERT_TRUE(m_a.isConsistent() && (m_max == 0) == (m_a.dataPtr() == nullptr)) << "step " << step;
            // Only remax gives capacity back; a move replaces the block altogether.
            ASSERT_TRUE(m_a.getMax() >= prevMax || op == "remax" || op == "move=") << "step " << step;
            if constexpr (std::is_same_v<T, Counted>) {
                ASSERT_EQ(Counted::live(), m_a.size()) << "step " << step << " after " << op;
                ASSERT_EQ(Counted::errors, 0) << "step " << step << " after " << op;
            }
        }
    }

private:
    int64_t pick(int64_t n) { return n <= 0 ? 0 : int64_t(m_rng() % uint64_t(n)); }
    int value() { return int(pick(20)); }
    int64_t size() const { return int64_t(m_m.size()); }
    Ints randomValues(int64_t maxCount)
    {
        Ints v(size_t(pick(maxCount + 1)));
        std::generate(v.begin(), v.end(), [this] { return value(); });
        return v;
    }
    ZmDArray<T> arrayOf(const Ints& values)
    {
        ZmDArray<T> r;
        for (int v : values) {
            r.append(Elem::make<T>(v));
        }
        return r;
    }

    // The growth rule: nothing while \p needed fits, else max(trunc(size * 1.5), needed).
    int64_t grown(int64_t needed) const
    {
        return needed <= m_max ? m_max : std::max(int64_t(double(size()) * 1.5), needed);
    }
    void insertModel(int64_t pos, const Ints& values)
    {
        if (!values.empty()) {
            m_max = grown(size() + int64_t(values.size()));
            m_m.insert(m_m.begin() + pos, values.begin(), values.end());
        }
    }
    // Slots [from, to) came into use without a value: class types must hold default objects.
    // Then both sides get the same known values.
    void fillNew(int64_t from, int64_t to)
    {
        for (int64_t i = from; i < to; ++i) {
            if constexpr (!std::is_same_v<T, int>) {
                EXPECT_TRUE(Elem::isDefault(m_a[i])) << "slot " << i << " not default-constructed";
            }
            m_m[size_t(i)] = value();
            m_a[i] = Elem::make<T>(m_m[size_t(i)]);
        }
    }
    void eraseValue(int v) { m_m.erase(std::remove(m_m.begin(), m_m.end(), v), m_m.end()); }

    const char* doStep()
    {
        const int64_t n = size();
        switch (n > 250 ? -1 : pick(22)) {
        case -1:
            m_a.remove(0, n / 2);
            m_m.erase(m_m.begin(), m_m.begin() + n / 2);
            return "trim";
        case 0: {
            const int v = value();
            EXPECT_EQ(m_a.append(Elem::make<T>(v)), n);
            insertModel(n, {v});
            return "append";
        }
        case 1: {
            const int64_t pos = pick(n + 1);
            const int v = value();
            m_a.insert(pos, Elem::make<T>(v));
            insertModel(pos, {v});
            return "insert";
        }
        case 2: {
            const Ints values = randomValues(5);
            const ZmDArray<T> src = arrayOf(values);
            const int64_t pos = pick(n + 1);
            m_a.insert(pos, src.size(), src.dataPtr());
            insertModel(pos, values);
            return "insert range";
        }
        case 3: { // a range of itself, anywhere relative to the insertion point
            const int64_t k = pick(n), count = std::min<int64_t>(n - k, 1 + pick(n - k)), pos = pick(n + 1);
            const Ints values(m_m.begin() + k, m_m.begin() + k + count);
            m_a.insert(pos, count, m_a.dataPtr() + k);
            insertModel(pos, values);
            return "insert from itself";
        }
        case 4: {
            if (n == 0 || n > 100) {
                return "noop";
            }
            const int64_t k = pick(n);
            const int v = m_m[size_t(k)];
            EXPECT_EQ(m_a.append(m_a[k]), n);
            insertModel(n, {v});
            const Ints all = m_m;
            EXPECT_EQ(m_a.appendArray(m_a), n + 1);
            insertModel(n + 1, all);
            return "append own element, appendArray(self)";
        }
        case 5: {
            const int64_t pos = pick(n + 1), count = pick(n - pos + 1);
            m_a.remove(pos, count);
            m_m.erase(m_m.begin() + pos, m_m.begin() + pos + count);
            return "remove";
        }
        case 6: {
            const int64_t count = pick(std::min<int64_t>(n, 6) + 1);
            m_a.removeLast(count);
            m_m.resize(size_t(n - count));
            return "removeLast";
        }
        case 7: {
            T out = Elem::make<T>(999); // untouched when the array is empty
            EXPECT_EQ(m_a.pop(out), n == 0 ? 0 : 1);
            EXPECT_EQ(Elem::value(out), n == 0 ? 999 : m_m.back());
            m_a.pop_back();
            m_m.resize(size_t(std::max<int64_t>(n - 2, 0)));
            return "pop, pop_back";
        }
        case 8: {
            const int64_t req = pick(n + 29) - 3, to = std::max<int64_t>(req, 0);
            m_max = grown(to);
            EXPECT_EQ(m_a.resize(req), to);
            m_m.resize(size_t(to));
            fillNew(n, to);
            return "resize";
        }
        case 9: {
            const int64_t count = pick(6);
            m_max = grown(n + count);
            EXPECT_EQ(m_a.appendSpace(count), n);
            m_m.resize(size_t(n + count));
            fillNew(n, n + count);
            return "appendSpace";
        }
        case 10: {
            const int64_t pos = pick(n + 1), count = pick(4);
            m_a.insertSpace(pos, count);
            insertModel(pos, Ints(size_t(count), -1));
            fillNew(pos, pos + count);
            return "insertSpace";
        }
        case 11: {
            const int64_t by = pick(2 * n + 1) - n;
            m_a.rotate(by);
            std::rotate(m_m.begin(), by < 0 ? m_m.begin() - by : m_m.end() - by, m_m.end());
            return "rotate";
        }
        case 12: {
            m_a.reverse();
            std::reverse(m_m.begin(), m_m.end());
            const int64_t i = pick(n), j = pick(n);
            if (n > 0) {
                m_a.swap(i, j);
                std::swap(m_m[size_t(i)], m_m[size_t(j)]);
            }
            return "reverse, swap";
        }
        case 13: {
            const Ints values = randomValues(6);
            m_a.join(arrayOf(values));
            m_a.join(m_a);
            for (int v : values) {
                if (std::find(m_m.begin(), m_m.end(), v) == m_m.end()) {
                    insertModel(size(), {v}); // one append at a time, each with its own growth
                }
            }
            return "join";
        }
        case 14: { // the value is sometimes one of the array's own elements
            const int64_t k = pick(n);
            const bool own = n > 0 && pick(2) == 0;
            const int v = own ? m_m[size_t(k)] : value();
            const int64_t removed = own ? m_a.removeValue(m_a[k]) : m_a.removeValue(Elem::make<T>(v));
            EXPECT_EQ(removed, std::count(m_m.begin(), m_m.end(), v));
            eraseValue(v);
            return "removeValue";
        }
        case 15: {
            const Ints values = randomValues(4);
            m_a.subtract(arrayOf(values));
            std::for_each(values.begin(), values.end(), [this](int v) { eraseValue(v); });
            if (pick(10) == 0) {
                m_a.subtract(m_a);
                m_m.clear();
            }
            return "subtract";
        }
        case 16: {
            if (pick(4) != 0) {
                return "noop";
            }
            const int64_t newMax = pick(n + 12) - 1, newSize = pick(n + 7) - 1;
            const int64_t ns = newSize < 0 ? n : newSize, target = std::max(newMax < 0 ? n : newMax, ns);
            EXPECT_EQ(m_a.remax(newMax, newSize), m_max - target);
            m_max = target;
            m_m.resize(size_t(ns));
            fillNew(std::min(n, ns), ns);
            return "remax";
        }
        case 17: {
            const Ints values = randomValues(n + 12);
            const ZmDArray<T> copy(m_a), other = arrayOf(values);
            EXPECT_EQ(copy.getMax(), n);
            EXPECT_TRUE(copy == m_a);
            m_a = other; // resize to the source's size, then element-wise copy
            m_max = grown(int64_t(values.size()));
            m_m = values;
            return "copy=";
        }
        case 18: {
            const Ints values = randomValues(n + 12);
            ZmDArray<T> other = arrayOf(values);
            ZmDArray<T> copy(other);
            m_a = std::move(copy);
            m_max = int64_t(values.size());
            m_m = values;
            return "move=";
        }
        case 19:
            if (pick(8) == 0) {
                m_a.clear();
                m_m.clear();
            }
            return "clear";
        case 20: {
            const int v = value();
            const auto it = std::find(m_m.begin(), m_m.end(), v);
            EXPECT_EQ(m_a.index(Elem::make<T>(v)), it == m_m.end() ? -1 : it - m_m.begin());
            EXPECT_EQ(m_a.contains(Elem::make<T>(v)), it != m_m.end());
            ZmDArray<T> other(0, n + 7); // equal content, different capacity
            other.appendArray(m_a);
            EXPECT_TRUE(other == m_a && !(other != m_a));
            if (n > 0) {
                other.last() = Elem::make<T>(m_m.back() + 1);
                EXPECT_TRUE(other != m_a && !(other == m_a));
            }
            return "queries";
        }
        default: {
            // Sorted, the array takes bisection: with only 20 values ties are frequent, and a new
            // element must land after every equal one.
            m_a.sort(compareByValue<T>);
            std::sort(m_m.begin(), m_m.end());
            const int v = value(), probe = value();
            const auto upper = std::upper_bound(m_m.begin(), m_m.end(), v) - m_m.begin();
            EXPECT_EQ(m_a.insertSorted(Elem::make<T>(v), compareByValue<T>), upper);
            insertModel(upper, {v});
            const int64_t found = m_a.findSorted(Elem::make<T>(probe), compareByValue<T>);
            if (std::binary_search(m_m.begin(), m_m.end(), probe)) {
                EXPECT_TRUE(found >= 0 && m_m[size_t(found)] == probe) << "findSorted " << probe;
            } else {
                EXPECT_EQ(found, -1) << "findSorted " << probe;
            }
            return "sort, insertSorted, findSorted";
        }
        }
    }

    std::mt19937 m_rng;
    ZmDArray<T> m_a;
    Ints m_m;
    int64_t m_max = 0;
};

} // namespace

TEST(ZmDArray, GrowthIsOneAndAHalfOfSize)
{
    IntArray a;
    EXPECT_EQ(a.dataPtr(), nullptr);
    std::vector<int64_t> seen;
    for (int i = 0; i < 141; ++i) {
        a.append(i);
        if (seen.empty() || seen.back() != a.getMax()) {
            seen.push_back(a.getMax());
        }
    }
    // max(trunc(size * 1.5), size + 1) each time a full array takes one more element.
    EXPECT_EQ(seen, (std::vector<int64_t>{1, 2, 3, 4, 6, 9, 13, 19, 28, 42, 63, 94, 141}));
    EXPECT_EQ(a.dataSizeInBytes(), 141 * int64_t(sizeof(int)));

    // The factor applies to the size, not to the capacity.
    IntArray b(2, 10);
    const Ints twenty(20, 7);
    EXPECT_EQ(b.append(20, twenty.data()), 2);
    EXPECT_EQ(b.getMax(), 22); // max(3, 22)
    b.push_back(1);
    EXPECT_EQ(b.getMax(), 33); // max(33, 23)
}

TEST(ZmDArray, ResizeRemaxAndConstructorCapacityRules)
{
    const IntArray raised(5, 2);
    EXPECT_EQ(raised.size(), 5);
    EXPECT_EQ(raised.getMax(), 5);
    const IntArray none(-1, -1);
    EXPECT_EQ(none.size() + none.getMax(), 0);
    EXPECT_EQ(none.dataPtr(), nullptr);

    IntArray a;
    EXPECT_EQ(a.resize(10), 10);
    const int* block = a.dataPtr();
    EXPECT_EQ(a.resize(-5), 0);
    EXPECT_EQ(a.getMax(), 10);
    EXPECT_EQ(a.dataPtr(), block);
    a.removeLast(2); // deliberately unchecked: the size goes negative
    EXPECT_EQ(a.size(), -2);

    IntArray r = makeInts({1, 2, 3, 4, 5});
    EXPECT_EQ(r.getMax(), 6);
    EXPECT_EQ(r.remax(-1, -1), 1);
    EXPECT_EQ(r.getMax(), 5);
    EXPECT_EQ(r.remax(2, 3), 2); // the capacity never falls below the new size
    EXPECT_EQ(contents(r), (Ints{1, 2, 3}));
    EXPECT_EQ(r.remax(0, 0), 3);
    EXPECT_EQ(r.dataPtr(), nullptr);
}

TEST(ZmDArray, CopiesMovesAndSwapsOwnTheRightBlock)
{
    IntArray a = makeInts({1, 2, 3, 4, 5});
    IntArray b(a);
    EXPECT_EQ(b.getMax(), 5); // exactly the source's size
    b[0] = 99;
    EXPECT_EQ(a[0], 1);
    const IntArray empty;
    EXPECT_EQ(IntArray(empty).dataPtr(), nullptr);
    IntArray& alias = b;
    b = alias;
    EXPECT_EQ(contents(b), (Ints{99, 2, 3, 4, 5}));

    int* block = a.dataPtr();
    IntArray moved(std::move(a));
    EXPECT_EQ(moved.dataPtr(), block);
    EXPECT_EQ(a.size() + a.getMax(), 0);
    EXPECT_EQ(a.dataPtr(), nullptr);
    IntArray c = makeInts({9});
    int* cBlock = c.dataPtr();
    c = std::move(moved); // swaps: moved now owns c's old block and frees it itself
    EXPECT_EQ(c.dataPtr(), block);
    EXPECT_EQ(moved.dataPtr(), cBlock);
    IntArray& self = c;
    c = std::move(self);
    EXPECT_EQ(contents(c), (Ints{1, 2, 3, 4, 5}));
    c.swapWith(moved);
    EXPECT_EQ(contents(c), (Ints{9}));
    EXPECT_EQ(moved.dataPtr(), block);
}

TEST(ZmDArray, ReleaseAndSetRawDataHandOverBlocksWithoutFreeing)
{
    IntArray a = makeInts({4, 5, 6});
    int* taken = a.dataPtr();
    a.release();
    EXPECT_EQ(a.dataPtr(), nullptr);
    EXPECT_EQ(a.getMax(), 0);
    EXPECT_EQ(taken[2], 6); // still ours: ASan reports a freed block here

    IntArray b = makeInts({1});
    int* old = b.dataPtr();
    b.setRawData(3, taken);
    zmfree(old); // a double free if setRawData had freed it
    EXPECT_EQ(b.getMax(), 3);
    b.append(7); // the adopted block is grown with zmrealloc, then freed by b
    EXPECT_EQ(contents(b), (Ints{4, 5, 6, 7}));
    EXPECT_EQ(b.getMax(), 4);
}

TEST(ZmDArray, AddingItsOwnElementsSurvivesReallocation)
{
    IntArray a = makeInts({0, 1, 2, 3});
    ASSERT_EQ(a.getMax(), a.size());
    EXPECT_EQ(a.append(a[3]), 4);
    EXPECT_EQ(contents(a), (Ints{0, 1, 2, 3, 3}));

    ZmDArray<ZmString> s;
    for (int i = 0; i < 4; ++i) {
        s.append(ZmString(0, "string number %d, long enough to live on the heap", i));
    }
    s.append(s[1]);
    EXPECT_STREQ(s[4].getString(), "string number 1, long enough to live on the heap");

    // Every source range of a full array (so that the block moves) at every insertion point.
    const Ints base = {10, 11, 12, 13, 14, 15};
    for (int64_t pos = 0; pos <= 6; ++pos) {
        for (int64_t k = 0; k < 6; ++k) {
            for (int64_t n = 1; k + n <= 6; ++n) {
                IntArray full;
                full.append(6, base.data());
                full.insert(pos, n, full.dataPtr() + k);
                Ints model = base;
                model.insert(model.begin() + pos, base.begin() + k, base.begin() + k + n);
                ASSERT_EQ(contents(full), model) << "pos " << pos << " k " << k << " n " << n;
            }
        }
    }
    IntArray b = makeInts({1, 2, 3});
    EXPECT_EQ(b.appendArray(b), 3);
    b.insertArray(2, b);
    EXPECT_EQ(contents(b), (Ints{1, 2, 1, 2, 3, 1, 2, 3, 3, 1, 2, 3}));
}

TEST(ZmDArray, BisectionBoundsEmptyArrayAndStableTies)
{
    // An empty array is answered without calling the comparison.
    static int calls = 0;
    const auto counting = [](const int& x, const int& y) {
        ++calls;
        return compareInts(x, y);
    };
    IntArray e;
    EXPECT_EQ(e.findSorted(5, counting), -1);
    EXPECT_EQ(e.insertSorted(5, counting), 0);
    EXPECT_EQ(calls, 0);
    EXPECT_EQ(contents(e), (Ints{5}));

    const IntArray a = makeInts({1, 2, 3, 4, 5, 6});
    EXPECT_EQ(a.findSorted(2, compareInts, 2, -1), -1); // lo is exclusive: index 1 is outside
    EXPECT_EQ(a.findSorted(5, compareInts, 2, -1), 4);
    EXPECT_EQ(a.findSorted(6, compareInts, -1, 3), -1);
    EXPECT_EQ(a.findSorted(4, compareInts, -1, 3), 3); // the final test looks at hi itself

    // A new element goes after every element comparing equal: the tags show the order.
    struct Keyed {
        int key, tag;
    };
    ZmDArray<Keyed> k;
    const auto byKey = [](const Keyed& x, const Keyed& y) { return compareInts(x.key, y.key); };
    for (const Keyed& v : {Keyed{3, 0}, Keyed{1, 1}, Keyed{3, 2}, Keyed{1, 3}, Keyed{3, 4}}) {
        k.insertSorted(v, byKey);
    }
    std::string order;
    for (const Keyed& v : k) {
        order += std::to_string(v.key) + ":" + std::to_string(v.tag) + " ";
    }
    EXPECT_EQ(order, "1:1 1:3 3:0 3:2 3:4 ");
}

TEST(ZmDArray, ReorderingAndSetOperationsOnKnownInputs)
{
    IntArray a = makeInts({1, 2, 3});
    a.rotate(-1);
    EXPECT_EQ(contents(a), (Ints{2, 3, 1}));
    a = makeInts({1, 2, 3});
    a.rotate(1);
    EXPECT_EQ(contents(a), (Ints{3, 1, 2}));

    ZmDArray<char> set;
    set.append('a');
    ZmDArray<char> other;
    other.append(4, "babc");
    set.join(other);
    EXPECT_EQ(std::string(set.begin(), set.end()), "abc");

    a = makeInts({1, 2, 1, 3, 1});
    const int64_t max = a.getMax();
    EXPECT_EQ(a.removeValue(1), 3);
    EXPECT_EQ(contents(a), (Ints{2, 3}));
    a = makeInts({1, 2, 2, 3, 2, 4});
    a.subtract(makeInts({2, 8}));
    EXPECT_EQ(contents(a), (Ints{1, 3, 4}));
    EXPECT_EQ(a.getMax(), max); // removal releases nothing

    EXPECT_TRUE(IntArray() == IntArray(0, 10)); // empty arrays are equal whatever their capacities
    IntArray prefix = makeInts({1, 2});
    prefix.pop_back(); // the 2 stays in the block, past the size
    EXPECT_TRUE(makeInts({1, 2}) != prefix);

    // k = 0 does not exceed the size 0; under UBSan a null block must not reach the byte copies.
    IntArray never;
    never.rotate(0);
    EXPECT_EQ(never.size(), 0);
}

TEST(ZmDArray, ClassElementsAreCopiedInPlaceAndRelocatedWithoutCopies)
{
    Counted::reset();
    {
        ZmDArray<Counted> a;
        for (int i = 0; i < 4; ++i) {
            a.append(Counted(i));
        }
        ZmDArray<Counted> src;
        src.append(3, a.dataPtr());
        Counted::copyLog.clear();
        a.insert(1, src.size(), src.dataPtr());       // grows
        EXPECT_EQ(Counted::copyLog, (Ints{2, 1, 0})); // exactly n copies, last new slot first

        const int64_t constructed = Counted::constructed;
        a.append(a[0]);
        a.rotate(-3);
        a.reverse();
        a.swap(0, 5);
        a.sort(compareByValue<Counted>);
        a.remove(0, 2);
        EXPECT_EQ(Counted::constructed, constructed + 1); // only the appended copy
        a.removeValue(a[0]);
        EXPECT_EQ(Counted::live(), a.size() + src.size());
        a.resize(10);
        a.remax(-1, 12);
        EXPECT_EQ(Counted::live(), a.size() + src.size());
        EXPECT_EQ(a[11].value, -1);
    }
    EXPECT_EQ(Counted::constructed, Counted::destroyed);
    EXPECT_EQ(Counted::errors, 0);
}

// The random programs run with ASan/LSan watching every element block.
TEST(ZmDArray, RandomProgramsMatchVectorModelAndKeepLifetimesExact)
{
    for (uint32_t seed : {1u, 2u, 3u, 4u, 5u}) {
        RandomProgram<int>(seed).run(4000);
        ASSERT_FALSE(HasFatalFailure()) << "int, seed " << seed;
    }
    for (uint32_t seed : {11u, 12u, 13u}) {
        RandomProgram<ZmString>(seed).run(2000);
        ASSERT_FALSE(HasFatalFailure()) << "ZmString, seed " << seed;
    }
    for (uint32_t seed : {21u, 22u, 23u}) {
        Counted::reset();
        RandomProgram<Counted>(seed).run(2000);
        ASSERT_FALSE(HasFatalFailure()) << "Counted, seed " << seed;
        EXPECT_EQ(Counted::constructed, Counted::destroyed) << "seed " << seed;
        EXPECT_EQ(Counted::errors, 0) << "seed " << seed;
    }
}
