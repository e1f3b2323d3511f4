/// \file
/// Objects with an editing state and listeners.
#pragma once

#include <zmlib/ZmDArray.h>
#include <zmlib/ZmEditingListener.h>
#include <zmlib/ZmExport.h>

/// An object that can be in an editing session, described by a caller-defined bit mask, with
/// listeners told when a session starts and finishes (first registered first).
///
/// Listeners are not owned; duplicates are allowed. Copies carry the flags and the listener list.
/// Single-threaded.
class ZMLIB_API ZmEditable {
public:
    ZmEditable() = default;
    ZmEditable(const ZmEditable&) = default;
    ZmEditable& operator=(const ZmEditable&) = default;

    /// Sets the flags, then tells every listener.
    virtual void startEditing(int flags);
    /// Tells every listener, then clears the flags.
    virtual void finishEditing();
    /// Any bit of \p mask is being edited.
    virtual bool isEdited(int mask) const { return (m_editingFlags & mask) != 0; }
    /// Every bit of \p mask is being edited.
    virtual bool isAllEdited(int mask) const { return (m_editingFlags & mask) == mask; }
    virtual int getEditingFlags() const { return m_editingFlags; }
    virtual ~ZmEditable();

    /// Appends \p listener (no duplicate check).
    void addEditingListener(ZmEditingListener* listener) { m_listeners.append(listener); }
    /// Removes the first occurrence of \p listener, if any.
    void removeEditingListener(ZmEditingListener* listener);

private:
    int32_t m_editingFlags = 0;
    ZmDArray<ZmEditingListener*> m_listeners;
};
