/// \file
/// The two templates every typed identifier is built on: integer identifiers with a designated
/// empty value, and identifiers whose value is a class (128-bit keys, UUIDs).
#pragma once

/// An identifier holding one integer of type \p T; \p emptyValue means "no identifier".
///
/// Instances in use: `ZmID<int, 0>` (remote objects), `ZmID<int, -1>` (sessions),
/// `ZmID<int64_t, 0>` (unique objects, transfers), `ZmID<int64_t, -1>` (frames) and
/// `ZmID<int64_t, INT64_MIN>` for 64-bit identifiers whose every other value is meaningful.
/// Ordered by the value, with T's own (signed) comparison. A plain value: copy it freely between
/// threads; nothing fails.
template <class T, T emptyValue>
class ZmID {
public:
    constexpr ZmID() noexcept : m_value(emptyValue) {}
    ZmID(const ZmID& other) noexcept = default;
    ZmID& operator=(const ZmID& other) noexcept = default;

    constexpr const T& value() const noexcept { return m_value; }
    void valueSet(const T& v) noexcept { m_value = v; }
    constexpr bool isEmpty() const noexcept { return m_value == emptyValue; }
    constexpr bool isNotEmpty() const noexcept { return m_value != emptyValue; }
    void makeEmpty() noexcept { m_value = emptyValue; }

    constexpr bool operator==(const ZmID& o) const noexcept { return m_value == o.m_value; }
    constexpr bool operator!=(const ZmID& o) const noexcept { return m_value != o.m_value; }
    constexpr bool operator<(const ZmID& o) const noexcept { return m_value < o.m_value; }
    constexpr bool operator<=(const ZmID& o) const noexcept { return m_value <= o.m_value; }
    constexpr bool operator>(const ZmID& o) const noexcept { return m_value > o.m_value; }
    constexpr bool operator>=(const ZmID& o) const noexcept { return m_value >= o.m_value; }

protected:
    constexpr explicit ZmID(const T& v) noexcept : m_value(v) {}

    // Mutable on purpose: ZmRemotificationID::next() is const and still counts the identifier
    // on, and callers rely on that.
    mutable T m_value;
};

/// An identifier whose value is a class \p T (`Zm128`, `ZmUUID`): T's default value (all zero)
/// is "no identifier", `isValid()` and the ordering are T's. A plain value: copy it freely between
/// threads; nothing fails.
template <class T>
class ZmID_C {
public:
    ZmID_C() = default;
    explicit ZmID_C(const T& v) : m_value(v) {}
    ZmID_C(const ZmID_C& other) = default;
    ZmID_C& operator=(const ZmID_C& other) = default;

    const T& value() const noexcept { return m_value; }
    void valueSet(const T& v) { m_value = v; }
    bool isValid() const { return m_value.isValid(); }

    bool operator==(const ZmID_C& o) const { return m_value == o.m_value; }
    bool operator!=(const ZmID_C& o) const { return m_value != o.m_value; }
    bool operator<(const ZmID_C& o) const { return m_value < o.m_value; }
    bool operator<=(const ZmID_C& o) const { return m_value <= o.m_value; }
    bool operator>(const ZmID_C& o) const { return m_value > o.m_value; }
    bool operator>=(const ZmID_C& o) const { return m_value >= o.m_value; }

private:
    T m_value{};
};
