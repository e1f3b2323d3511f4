/// \file
/// Named memory shared between the processes of one machine.
#pragma once

#include <zmlib/ZmExport.h>

#include <cstdint>

struct ZmSharedMemPrivate;

/// A named block of memory that other processes can open under the same name: the first to ask
/// for a name creates the block, later ones attach to it and get the creator's size.
///
/// The block lives as long as any process holds it and disappears from the system when the last
/// holder lets go of it. The name is mapped onto a POSIX shared-memory object "/zmshm.<name>":
/// bytes other than letters, digits, '.', '_' and '-' are written as "%XX" (hexadecimal), and a
/// name whose mapped form would be too long is cut and completed with "~" and a hash of the whole
/// name. Null or an empty name gives a block that only this process (and its copies of the object)
/// can see. Only processes of the same user can attach. A child made by fork() may use the
/// parent's objects but does not count as a holder of its own; to hold a block beyond the parent,
/// it asks for the name with an object of its own.
///
/// Copies share one attachment: the copy and its source return the same view, and the last of
/// them releases it. One object (with its copies) is for one thread at a time. Failure is
/// reported by a null result only; nothing is logged.
class ZMLIB_API ZmSharedMem {
public:
    ZmSharedMem();
    ZmSharedMem(const ZmSharedMem& other);
    ZmSharedMem& operator=(const ZmSharedMem& other);
    ~ZmSharedMem();

    /// The block called \p name, created with room for at least \p size bytes when it does not
    /// exist yet (the size is rounded up to whole pages, always adding one page); an existing
    /// block keeps its size. Once a view is mapped, later calls return it whatever they ask for.
    /// Null on failure.
    char* buffer(const char* name, uint64_t size);

private:
    ZmSharedMemPrivate* m_d;
};
