/// \file
/// A bare callable object.
#pragma once

#include <zmlib/ZmExport.h>

/// Something to call without arguments: worker jobs and deferred actions derive from it.
class ZMLIB_API ZmCallable {
public:
    virtual ~ZmCallable();
    virtual void call() = 0;
    void operator()() { call(); }
};
