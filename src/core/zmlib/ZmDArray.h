/// \file
/// The library's growable array.
#pragma once

#include <zmlib/ZmExport.h>
#include <zmlib/ZmMemory.h>

#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <new>
#include <type_traits>
#include <utility>

/// Sorts \p n elements of \p size bytes at \p base with a comparison that receives \p context
/// (the runtime's qsort, not stable). The one non-template step of `ZmDArray::sort`, so that the
/// header carries no platform-specific sorting call.
ZMLIB_API void zmSortWithContext(void* base, size_t n, size_t size,
                                 int (*compare)(const void*, const void*, void*), void* context);

/// A growable array of bitwise-relocatable elements with signed 64-bit size and capacity.
///
/// Owns one block from `zmmalloc`/`zmrealloc` (null while the capacity is 0) and moves elements
/// inside it with raw byte copies, so an element type must be safe to relocate bitwise. Growth
/// goes to the larger of 1.5 times the current *size* and what is needed; the array never shrinks
/// its block by itself (only `remax` does). There is no bounds checking anywhere: indices are the
/// caller's responsibility.
///
/// Element lifetime: for types with trivial construction and destruction (numbers, pointers, plain
/// structs) slots that come into use without a value (`resize`, `appendSpace`, `insertSpace`, the
/// (size, max) constructor) are left uninitialised and removal only lowers the size. For other
/// types those slots are default-constructed and every element that leaves the array is
/// destroyed, so that `ZmDArray<ZmString>` neither leaks nor touches garbage. Copies into the array
/// are copy-constructed in place, from the last new slot to the first.
///
/// Failure: allocation failure throws `ZmMemoryException`, and an element copy or default
/// construction that throws passes its exception on. Either way the elements and the size are left
/// as they were before the call: whatever was built is destroyed again and the gap closed. Two
/// exceptions to that: an assignment of a whole array whose element assignment throws leaves a
/// mix of old and new values (every element still valid), and a failed growth inside an insert
/// or append leaves `getMax()` at the capacity it was growing to while the block keeps its old
/// size. A caller that catches the exception and goes on using the array must therefore call
/// `remax(-1, -1)` first, which makes the block and the capacity agree again; until then an
/// append that fits the stated capacity would write past the end of the block.
///
/// Not thread-safe: one thread at a time.
template <class T>
class ZmDArray {
public:
    using value_type = T;
    using iterator = T*;
    using const_iterator = const T*;
    /// qsort-style order: negative, zero or positive.
    using CompareFn = int (*)(const T&, const T&);

    ZmDArray() noexcept = default;
    /// Starts empty, then `remax(max, size)` (note the swapped order): the capacity is at least
    /// the size.
    ZmDArray(int64_t size, int64_t max)
    {
        try {
            remax(max, size);
        } catch (...) {
            zmfree(m_data); // no destructor runs for a constructor that throws
            throw;
        }
    }
    /// The copy's capacity is exactly the source's size.
    ZmDArray(const ZmDArray& other)
    {
        try {
            insert(0, other.m_size, other.m_data);
        } catch (...) {
            zmfree(m_data);
            throw;
        }
    }
    ZmDArray(ZmDArray&& other) noexcept : m_size(other.m_size), m_max(other.m_max), m_data(other.m_data)
    {
        other.m_size = 0;
        other.m_max = 0;
        other.m_data = nullptr;
    }
    ~ZmDArray()
    {
        destroyRange(0, m_size);
        m_size = 0;
        if (m_data != nullptr) {
            zmfree(m_data);
        }
    }

    ZmDArray& operator=(const ZmDArray& other)
    {
        if (this != &other) {
            resize(other.m_size);
            copyAssign(m_data, other.m_data, other.m_size);
        }
        return *this;
    }
    /// Swaps the three fields: the source ends up owning the old block.
    ZmDArray& operator=(ZmDArray&& other) noexcept
    {
        if (this != &other) {
            swapWith(other);
        }
        return *this;
    }
    void swapWith(ZmDArray& other) noexcept
    {
        std::swap(m_size, other.m_size);
        std::swap(m_max, other.m_max);
        std::swap(m_data, other.m_data);
    }

    /// Forgets the block without freeing it: the caller has taken it through `dataPtr()`.
    void release() noexcept
    {
        m_size = 0;
        m_max = 0;
        m_data = nullptr;
    }
    /// Adopts a block from `zmmalloc` holding \p n elements; the old block is not freed.
    void setRawData(int64_t n, T* p) noexcept
    {
        m_size = n;
        m_max = n;
        m_data = p;
    }

    // --- capacity ------------------------------------------------------------------------------

    /// Sets capacity and size; a negative value stands for the current size. The capacity becomes
    /// the larger of the two (0 frees the block). Returns old capacity - new capacity.
    int64_t remax(int64_t newMax, int64_t newSize);
    /// Sets the size (negative counts as 0), growing to max(1.5 * size, n); never shrinks the
    /// block. Returns the new size.
    int64_t resize(int64_t n);
    int64_t getMax() const noexcept { return m_max; }
    int64_t size() const noexcept { return m_size; }
    int64_t dataSizeInBytes() const noexcept { return m_size * static_cast<int64_t>(sizeof(T)); }
    bool isNotEmptyArray() const noexcept { return m_size != 0; }
    bool isValidIndex(int64_t i) const noexcept { return i >= 0 && i < m_size; }
    bool isConsistent() const noexcept { return m_max >= 0 && m_max >= m_size; }
    /// Size 0; nothing is freed.
    void clear()
    {
        destroyRange(0, m_size);
        m_size = 0;
    }

    // --- access (unchecked) --------------------------------------------------------------------

    T& operator[](int i) noexcept { return m_data[i]; }
    const T& operator[](int i) const noexcept { return m_data[i]; }
    T& operator[](unsigned int i) noexcept { return m_data[i]; }
    const T& operator[](unsigned int i) const noexcept { return m_data[i]; }
    T& operator[](long i) noexcept { return m_data[i]; }
    const T& operator[](long i) const noexcept { return m_data[i]; }
    T& operator[](unsigned long i) noexcept { return m_data[i]; }
    const T& operator[](unsigned long i) const noexcept { return m_data[i]; }
    T& operator[](long long i) noexcept { return m_data[i]; }
    const T& operator[](long long i) const noexcept { return m_data[i]; }
    T& operator[](unsigned long long i) noexcept { return m_data[i]; }
    const T& operator[](unsigned long long i) const noexcept { return m_data[i]; }

    T* dataPtr() noexcept { return m_data; }
    const T* dataPtr() const noexcept { return m_data; }
    T* begin() noexcept { return m_data; }
    const T* begin() const noexcept { return m_data; }
    T* end() noexcept { return m_data + m_size; }
    const T* end() const noexcept { return m_data + m_size; }
    T& first() noexcept { return m_data[0]; }
    const T& first() const noexcept { return m_data[0]; }
    T& front() noexcept { return m_data[0]; }
    const T& front() const noexcept { return m_data[0]; }
    T& last() noexcept { return m_data[m_size - 1]; }
    const T& last() const noexcept { return m_data[m_size - 1]; }
    T& back() noexcept { return m_data[m_size - 1]; }
    const T& back() const noexcept { return m_data[m_size - 1]; }
    operator T*() noexcept { return m_data; }
    operator const T*() const noexcept { return m_data; }

    // --- adding --------------------------------------------------------------------------------

    /// Adds \p v at the end (it may be an element of this array); returns its index.
    int64_t append(const T& v)
    {
        if constexpr (std::is_trivially_copyable_v<T>) {
            // The value is copied before growing, so an element of this array is safe to append
            // and the caller's variable need not live in memory across the call.
            const T value = v;
            if (m_size < m_max) {
                ++m_size;
            } else {
                insertMemory(m_size, 1);
            }
            m_data[m_size - 1] = value;
            return m_size - 1;
        } else {
            if (m_size < m_max) {
                new (static_cast<void*>(m_data + m_size)) T(v);
                return m_size++;
            }
            insert(m_size, 1, &v);
            return m_size - 1;
        }
    }
    int64_t push(const T& v) { return append(v); }
    void push_back(const T& v) { append(v); }
    /// Appends \p n elements from \p src; returns the index of the first.
    int64_t append(int64_t n, const T* src)
    {
        const int64_t at = m_size;
        insert(at, n, src);
        return at;
    }
    int64_t appendArray(const ZmDArray& other) { return append(other.m_size, other.m_data); }
    /// Grows by \p n slots (uninitialised for trivial types); returns the index of the first.
    int64_t appendSpace(int64_t n)
    {
        const int64_t at = m_size;
        resize(m_size + n);
        return at;
    }
    /// Opens a gap of \p n at \p pos and copies \p n elements from \p src into it. The source may
    /// lie inside this array: it is re-addressed after the block moves.
    void insert(int64_t pos, int64_t n, const T* src)
    {
        if constexpr (std::is_trivially_copyable_v<T>) {
            // Appending within capacity cannot move the source: the common case of every
            // string and buffer append stays a single copy (a move, since a source inside the
            // block may overlap the unused tail after a size reset such as string assignment).
            if (n > 0 && pos == m_size && m_size + n <= m_max) {
                std::memmove(static_cast<void*>(m_data + m_size), src, kElementSize * size_t(n));
                m_size += n;
                return;
            }
        }
        insertSlow(pos, n, src);
    }
    void insert(int64_t pos, const T& v) { insert(pos, 1, &v); }
    void insertArray(int64_t pos, const ZmDArray& other) { insert(pos, other.m_size, other.m_data); }
    /// Opens a gap of \p n slots at \p pos (uninitialised for trivial types).
    void insertSpace(int64_t pos, int64_t n)
    {
        if (n <= 0) {
            return;
        }
        insertMemory(pos, n);
        try {
            constructRange(pos, pos + n);
        } catch (...) {
            closeGap(pos, n);
            throw;
        }
    }

    // --- removing ------------------------------------------------------------------------------

    /// Removes \p n elements at \p pos (nothing for n <= 0); memory is kept.
    void remove(int64_t pos, int64_t n)
    {
        if (n <= 0) {
            return;
        }
        destroyRange(pos, pos + n);
        const int64_t tail = m_size - pos - n;
        if (tail > 0) {
            relocate(m_data + pos, m_data + pos + n, tail);
        }
        m_size -= n;
    }
    /// Lowers the size by \p n without any check: a count above the size leaves a negative size.
    /// Deliberate; callers guarantee the count.
    void removeLast(int64_t n)
    {
        if (n > 0) {
            destroyRange(m_size - n < 0 ? 0 : m_size - n, m_size);
        }
        m_size -= n;
    }
    /// Copies the last element into \p out and removes it; 0 when empty, else 1.
    int64_t pop(T& out)
    {
        if (m_size < 1) {
            return 0;
        }
        out = m_data[m_size - 1];
        destroyRange(m_size - 1, m_size);
        --m_size;
        return 1;
    }
    void pop_back()
    {
        if (m_size >= 1) {
            destroyRange(m_size - 1, m_size);
            --m_size;
        }
    }
    /// Removes every element equal to \p v; returns how many went.
    int64_t removeValue(const T& v);
    /// Removes every occurrence of each element of \p other (all copies, not one per copy).
    void subtract(const ZmDArray& other);

    // --- searching and ordering ----------------------------------------------------------------

    bool contains(const T& v) const { return index(v) >= 0; }
    /// First index holding \p v, or -1.
    int64_t index(const T& v) const
    {
        for (int64_t i = 0; i < m_size; ++i) {
            if (m_data[i] == v) {
                return i;
            }
        }
        return -1;
    }
    /// Bisection between the exclusive bounds \p lo and \p hi (-1 for hi means the size); returns
    /// an index comparing equal to \p v, or -1.
    int64_t findSorted(const T& v, CompareFn compare, int64_t lo = -1, int64_t hi = -1) const;
    /// Inserts \p v after every element comparing equal to it (stable); returns its index.
    int64_t insertSorted(const T& v, CompareFn compare, int64_t lo = -1, int64_t hi = -1);
    /// The runtime's qsort over the whole array (not stable).
    void sort(CompareFn compare);
    void reverse();
    void swap(int64_t i, int64_t j);
    /// Rotates by |n| toward the back (n >= 0) or the front (n < 0). |n| must not exceed the
    /// size: it is deliberately not reduced modulo the size.
    void rotate(int64_t n);
    /// Appends each element of \p other not yet contained (ordered set union).
    void join(const ZmDArray& other);
    void fill(const T& v)
    {
        for (int64_t i = 0; i < m_size; ++i) {
            m_data[i] = v;
        }
    }
    void fillZero()
    {
        if (m_size > 0) {
            std::memset(static_cast<void*>(m_data), 0, kElementSize * size_t(m_size));
        }
    }

    /// Equal sizes and equal elements; capacities do not matter.
    bool operator==(const ZmDArray& other) const
    {
        if (m_size != other.m_size) {
            return false;
        }
        for (int64_t i = 0; i < m_size; ++i) {
            if (!(m_data[i] == other.m_data[i])) {
                return false;
            }
        }
        return true;
    }
    bool operator!=(const ZmDArray& other) const { return !(*this == other); }

protected:
    /// Opens an uninitialised gap of \p n at \p pos, growing to max(1.5 * size, size + n).
    /// The capacity field is updated before the reallocation: after a failed growth it already
    /// holds the new value while the block is the old one (see the class comment for what a
    /// caller that catches the failure must do). Deliberate, kept for callers that inspect the
    /// capacity after catching the failure (resize and remax update it afterwards).
    void insertMemory(int64_t pos, int64_t n);

    int64_t m_size = 0;
    int64_t m_max = 0;
    T* m_data = nullptr;

private:
    // The element size in one place: for pointer element types a size check would otherwise read
    // sizeof(T) as the suspicious sizeof of a pointer.
    static constexpr size_t kElementSize = sizeof(T); // NOLINT(bugprone-sizeof-expression)
    static constexpr bool kTrivialLifetime =
        std::is_trivially_default_constructible_v<T> && std::is_trivially_destructible_v<T>;

    static int64_t grownCapacity(int64_t size, int64_t needed)
    {
        // 1.5 times the size, computed in double and truncated, as the growth rule is defined.
        const auto grown = static_cast<int64_t>(static_cast<double>(size) * 1.5);
        return grown > needed ? grown : needed;
    }
    static size_t bytesFor(int64_t n)
    {
        // A count whose byte size does not fit saturates, so that the heap refuses it and the
        // caller gets the usual ZmMemoryException instead of a wrapped-around small block.
        if (n < 0 || static_cast<uint64_t>(n) > SIZE_MAX / kElementSize) {
            return SIZE_MAX;
        }
        return static_cast<size_t>(n) * kElementSize;
    }
    void reallocate(int64_t newMax) { m_data = static_cast<T*>(zmrealloc(m_data, bytesFor(newMax))); }
    /// Default-constructs slots \p from .. \p to - 1; when a constructor throws, the slots built
    /// so far are destroyed again before the exception goes on.
    void constructRange(int64_t from, int64_t to)
    {
        if constexpr (!kTrivialLifetime) {
            int64_t i = from;
            try {
                for (; i < to; ++i) {
                    new (static_cast<void*>(m_data + i)) T();
                }
            } catch (...) {
                destroyRange(from, i);
                throw;
            }
        } else {
            (void)from;
            (void)to;
        }
    }
    void destroyRange(int64_t from, int64_t to)
    {
        if constexpr (!std::is_trivially_destructible_v<T>) {
            for (int64_t i = from; i < to; ++i) {
                m_data[i].~T();
            }
        } else {
            (void)from;
            (void)to;
        }
    }
    /// Moves \p n elements as raw bytes (ranges may overlap). Elements are bitwise relocatable
    /// by contract, class types included, so no constructor or destructor runs.
    static void relocate(T* dst, const T* src, int64_t n)
    {
        std::memmove(static_cast<void*>(dst), static_cast<const void*>(src), kElementSize * size_t(n));
    }
    static void copyAssign(T* dst, const T* src, int64_t n)
    {
        if constexpr (std::is_trivially_copyable_v<T>) {
            if (n > 0) {
                std::memcpy(static_cast<void*>(dst), src, kElementSize * size_t(n));
            }
        } else {
            for (int64_t i = 0; i < n; ++i) {
                dst[i] = src[i];
            }
        }
    }
    void insertSlow(int64_t pos, int64_t n, const T* src);
    /// Undoes insertMemory(pos, n) for a gap holding no live element: moves the tail back down.
    void closeGap(int64_t pos, int64_t n) noexcept
    {
        const int64_t tail = m_size - pos - n;
        if (tail > 0) {
            relocate(m_data + pos, m_data + pos + n, tail);
        }
        m_size -= n;
    }
    /// Narrows the exclusive bounds (lo, hi) around the place of \p v (hi -1 = the size).
    void bisect(const T& v, CompareFn compare, int64_t& lo, int64_t& hi) const;
};

template <class T>
int64_t ZmDArray<T>::remax(int64_t newMax, int64_t newSize)
{
    const int64_t oldMax = m_max;
    if (newMax < 0) {
        newMax = m_size;
    }
    if (newSize < 0) {
        newSize = m_size;
    }
    const int64_t target = newMax > newSize ? newMax : newSize;
    if (newSize < m_size) {
        destroyRange(newSize, m_size);
        m_size = newSize;
    }
    if (target != m_max) {
        if (target == 0) {
            zmfree(m_data);
            m_data = nullptr;
        } else {
            reallocate(target);
        }
        m_max = target;
    }
    if (newSize > m_size) {
        constructRange(m_size, newSize);
    }
    m_size = newSize;
    return oldMax - m_max;
}

template <class T>
int64_t ZmDArray<T>::resize(int64_t n)
{
    if (n < 0) {
        n = 0;
    }
    if (n > m_max) {
        const int64_t newMax = grownCapacity(m_size, n);
        if (newMax != m_max) {
            reallocate(newMax);
            m_max = newMax;
        }
    }
    if (n > m_size) {
        constructRange(m_size, n);
    } else {
        destroyRange(n, m_size);
    }
    m_size = n;
    return n;
}

template <class T>
void ZmDArray<T>::insertMemory(int64_t pos, int64_t n)
{
    const int64_t needed = m_size + n;
    if (needed > m_max) {
        m_max = grownCapacity(m_size, needed); // before the reallocation: see the declaration
        reallocate(m_max);
    }
    if (pos < m_size) {
        relocate(m_data + pos + n, m_data + pos, m_size - pos);
    }
    m_size = needed;
}

template <class T>
void ZmDArray<T>::insertSlow(int64_t pos, int64_t n, const T* src)
{
    if (n <= 0) {
        return;
    }
    if (m_data != nullptr && src >= m_data && src < m_data + m_max) {
        // The source lives in our own block, which may move or shift: remember it by index.
        // Only elements pos .. size - 1 are shifted up; bytes past the size stay where they are.
        int64_t at = src - m_data;
        const int64_t oldSize = m_size;
        insertMemory(pos, n);
        if (at >= pos && at < oldSize) {
            at += n;
        }
        src = m_data + at;
    } else {
        insertMemory(pos, n);
    }
    if constexpr (std::is_trivially_copyable_v<T>) {
        std::memmove(static_cast<void*>(m_data + pos), src, kElementSize * size_t(n));
    } else {
        // Built from the last new slot to the first. A copy that throws leaves slots i + 1 .. n - 1
        // built: they are destroyed and the gap closed, so the array is as it was (the size is
        // not left counting slots that hold nothing).
        int64_t i = n - 1;
        try {
            for (; i >= 0; --i) {
                new (static_cast<void*>(m_data + pos + i)) T(src[i]);
            }
        } catch (...) {
            destroyRange(pos + i + 1, pos + n);
            closeGap(pos, n);
            throw;
        }
    }
}

template <class T>
int64_t ZmDArray<T>::removeValue(const T& v)
{
    // A stable compaction in one pass: the same survivors, in the same order, as removing each
    // match from the back, without a memmove per match. The value is copied first because it may
    // be one of our own elements.
    const T value = v;
    int64_t kept = 0;
    for (int64_t i = 0; i < m_size; ++i) {
        if (m_data[i] == value) {
            destroyRange(i, i + 1);
        } else {
            if (kept != i) {
                relocate(m_data + kept, m_data + i, 1);
            }
            ++kept;
        }
    }
    const int64_t removed = m_size - kept;
    m_size = kept;
    return removed;
}

template <class T>
void ZmDArray<T>::subtract(const ZmDArray& other)
{
    if (&other == this) {
        clear();
        return;
    }
    for (int64_t i = 0; i < other.m_size && m_size > 0; ++i) {
        removeValue(other.m_data[i]);
    }
}

template <class T>
void ZmDArray<T>::bisect(const T& v, CompareFn compare, int64_t& lo, int64_t& hi) const
{
    if (hi == -1) {
        hi = m_size;
    }
    while (hi - lo > 1) {
        const int64_t mid = (lo + hi) / 2;
        if (compare(v, m_data[mid]) < 0) {
            hi = mid;
        } else {
            lo = mid; // ties move lo up: equal elements stay before v
        }
    }
}

template <class T>
int64_t ZmDArray<T>::findSorted(const T& v, CompareFn compare, int64_t lo, int64_t hi) const
{
    bisect(v, compare, lo, hi);
    if (lo >= 0 && compare(v, m_data[lo]) == 0) {
        return lo;
    }
    if (hi < m_size && compare(v, m_data[hi]) == 0) {
        return hi;
    }
    return -1;
}

template <class T>
int64_t ZmDArray<T>::insertSorted(const T& v, CompareFn compare, int64_t lo, int64_t hi)
{
    bisect(v, compare, lo, hi);
    insert(lo + 1, 1, &v);
    return lo + 1;
}

template <class T>
void ZmDArray<T>::sort(CompareFn compare)
{
    if (m_size < 2) {
        return;
    }
    auto trampoline = [](const void* a, const void* b, void* fn) -> int {
        return reinterpret_cast<CompareFn>(fn)(*static_cast<const T*>(a), *static_cast<const T*>(b));
    };
    zmSortWithContext(m_data, size_t(m_size), sizeof(T), trampoline, reinterpret_cast<void*>(compare));
}

template <class T>
void ZmDArray<T>::swap(int64_t i, int64_t j)
{
    // Bitwise exchange: elements are relocatable by contract, and no copy constructor runs.
    alignas(T) unsigned char tmp[sizeof(T)];
    std::memcpy(tmp, static_cast<const void*>(m_data + i), sizeof(T));
    std::memcpy(static_cast<void*>(m_data + i), static_cast<const void*>(m_data + j), sizeof(T));
    std::memcpy(static_cast<void*>(m_data + j), tmp, sizeof(T));
}

template <class T>
void ZmDArray<T>::reverse()
{
    for (int64_t i = 0; i < m_size / 2; ++i) {
        swap(i, m_size - 1 - i);
    }
}

template <class T>
void ZmDArray<T>::rotate(int64_t n)
{
    const int64_t k = n < 0 ? -n : n;
    if (k == 0) {
        return;
    }
    const size_t kBytes = bytesFor(k);
    void* tmp = zmmalloc(kBytes);
    if (n < 0) {
        std::memcpy(tmp, static_cast<const void*>(m_data), kBytes);
        relocate(m_data, m_data + k, m_size - k);
        std::memcpy(static_cast<void*>(m_data + (m_size - k)), tmp, kBytes);
    } else {
        std::memcpy(tmp, static_cast<const void*>(m_data + (m_size - k)), kBytes);
        relocate(m_data + k, m_data, m_size - k);
        std::memcpy(static_cast<void*>(m_data), tmp, kBytes);
    }
    zmfree(tmp);
}

template <class T>
void ZmDArray<T>::join(const ZmDArray& other)
{
    if (&other == this) {
        return; // every element is already contained
    }
    for (int64_t i = 0; i < other.m_size; ++i) {
        if (!contains(other.m_data[i])) {
            append(other.m_data[i]);
        }
    }
}

// The char instantiation is part of the library's interface; everything else is instantiated
// where it is used.
extern template class ZMLIB_API ZmDArray<char>;
