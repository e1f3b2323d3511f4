/// \file
/// The private part of ZmSharedMem and its platform interface (private). ZmSharedMem_posix.cpp
/// implements the interface.
#pragma once

#include <zmlib/ZmSharedCount_p.h>
#include <zmlib/ZmString.h>

#include <cstdint>

struct ZmSharedMemPrivate {
    ZmSharedCount refs;
    bool valid = false;
    /// The platform's hold on a named object (a descriptor on POSIX); -1 for none, also for a
    /// block without a name.
    intptr_t handle = -1;
    char* view = nullptr;
    uint64_t viewSize = 0;
    /// The platform's name of the object, needed to remove it.
    ZmString objectName;
    /// The process that took the hold: a child that inherited it by fork() shares it with its
    /// parent and must not let go of it.
    unsigned long holderPid = 0;

    static void destroy(ZmSharedMemPrivate* d);
};

/// The unit in which blocks are mapped (the page size).
uint64_t zmSharedMemGranularity();

/// Maps \p bytes (a whole number of granules) of the block \p name, creating it when nobody holds
/// it, or of a block of its own when \p name is null or empty; sets view, viewSize and valid.
/// On failure the part may keep a hold that zmSharedMemRelease() lets go of.
bool zmSharedMemAttach(ZmSharedMemPrivate& d, const char* name, uint64_t bytes);

/// Unmaps the view and lets go of the block, removing it when this was its last holder.
void zmSharedMemRelease(ZmSharedMemPrivate& d);
