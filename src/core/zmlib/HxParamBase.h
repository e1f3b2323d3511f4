/// \file
/// The common part of the nodes of a parameter tree.
#pragma once

#include <zmlib/ZmExport.h>

#include <cstdint>

class HxParamBundle;
class HxParamEditCheck;

/// A node of a parameter tree: a bundle (`HxParamBundle`, an inner node) or a parameter
/// (`HxParameter`, a leaf). Every node has a name, a parent (null for a root), touch bits that
/// record changes, protection and output flags, and optionally an edit check.
///
/// Names are sanitised when set (`setName`): an empty name becomes "Bundle<n>" or
/// "Parameter<n>" from a per-kind process-wide counter; a name beginning with a digit gets "_"
/// in front; every character other than an ASCII letter, digit or "-" becomes "_", except the
/// Latin-1 letters Ä Ö Ü ß ä è é ê ö ü, which become A O U s a e e e o u. A bundle name holding a
/// space keeps only its first word; the rest goes into the bundle's string parameter "Name" (its
/// alias names). Lookups compare names ASCII case-insensitively, and a search key ends at its
/// first space.
///
/// Touch bits: 0x10 touched at all; 0x01 and 0x02 a change of the node itself (0x01 a rename,
/// 0x02 a value or structural change), 0x04 and 0x08 the same changes below it. `touch` carries a
/// change up to the root, turning 0x01 into 0x04 and 0x02 into 0x08 at each step.
///
/// Not thread-safe: a tree belongs to one thread at a time.
class ZMLIB_API HxParamBase {
public:
    enum Type : uint8_t { PARAMETER = 0, BUNDLE = 1 };
    /// Flag bits (16 bits in all).
    enum Flag : int {
        TRANSIENT = 0x0001,           ///< left out when printed to a FILE stream
        NO_COPY = 0x0002,             ///< skipped by `HxParamBundle::copy`
        NO_DELETE = 0x0004,           ///< `HxParamBundle::remove` keeps the node
        NO_INSERT_BUNDLE = 0x0008,    ///< the default check refuses new sub-bundles
        NO_INSERT_PARAMETER = 0x0010, ///< the default check refuses new parameters
        NO_RENAME = 0x0020,           ///< the default check refuses a rename
        NO_SET_VALUE = 0x0040,        ///< the default check refuses a new value
        HIDDEN = 0x0080               ///< never printed
    };

    HxParamBase& operator=(HxParamBase&&) = delete;
    /// Returns a deep copy owned by the caller.
    virtual HxParamBase* duplicate() const = 0;
    virtual ~HxParamBase();

    /// Never null.
    const char* name() const noexcept { return m_name; }
    /// Sanitises and stores \p name as the class comment says; a real change of name sets the
    /// touch bits 0x11 and touches the parent with 0x04. Passing `name()` itself does nothing.
    void setName(const char* name);
    HxParamBundle* parent() const noexcept { return m_parent; }
    bool isBundle() const noexcept { return m_type == BUNDLE; }

    /// The flags AND \p mask.
    int flag(int mask) const noexcept { return m_flags & mask; }
    /// Sets (\p on non-zero) or clears the bits of \p mask.
    void setFlag(int mask, int on) noexcept;

    /// The touch bits AND \p mask.
    int isNew(int mask) const noexcept { return m_touched & mask; }
    /// Marks the node with \p mask | 0x10 and its ancestors with the bits carried up (nothing for
    /// a mask of 0).
    void touch(int mask) noexcept;
    /// Clears the bits of \p mask on this node.
    void untouch(int mask) noexcept { m_touched = uint8_t(m_touched & ~mask); }

    /// The node's own check, else the nearest ancestor's, else the default check.
    HxParamEditCheck* editCheck() const;
    /// \p check is not owned; null falls back to the ancestors' check.
    void setEditCheck(HxParamEditCheck* check) noexcept { m_editCheck = check; }

    /// Compares a stored name with a search key as every lookup does: ASCII case-insensitive, the
    /// key ending at its first space; -1, 0 or 1. A null name sorts first, a null key last.
    static int compareNames(const char* name, const char* key) noexcept;

protected:
    /// Parameters take their name here; a bundle sets it in its own constructor, once its
    /// children exist (its name may fill its "Name" parameter).
    HxParamBase(Type type, const char* name);
    /// Copies type, touch bits and flags; the name as for the constructor.
    HxParamBase(const HxParamBase& other);
    /// Clears the touch bits, copies the flags and renames.
    HxParamBase& operator=(const HxParamBase& other);

private:
    friend class HxParamBundle;

    HxParamBundle* m_parent = nullptr;
    uint8_t m_type;
    uint8_t m_touched = 0;
    uint16_t m_flags = 0;
    char* m_name = nullptr;
    HxParamEditCheck* m_editCheck = nullptr;
};
