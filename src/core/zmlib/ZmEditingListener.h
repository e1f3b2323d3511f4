/// \file
/// Observers of editing sessions.
#pragma once

#include <zmlib/ZmExport.h>

class ZmEditable;

/// Told when a `ZmEditable` starts and finishes an editing session. Not owned by the editable:
/// remove a listener before it dies.
class ZMLIB_API ZmEditingListener {
public:
    virtual void editingStarted(ZmEditable* editable) = 0;
    virtual void editingFinished(ZmEditable* editable) = 0;

protected:
    ~ZmEditingListener() = default;
};
