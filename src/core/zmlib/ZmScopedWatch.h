/// \file
/// Adds the duration of a block to a stopwatch.
#pragma once

#include <zmlib/ZmExport.h>

class ZmWatch;

/// Lets a block add its own duration to a `ZmWatch`: a watch that is not running is continued at
/// construction and stopped at destruction; a watch that is already running is left alone.
///
/// Holds a reference to the watch, which must outlive it; used by one thread like the watch.
class ZMLIB_API ZmScopedWatch {
public:
    /// \p reset clears (and stops) the watch first, so that it measures this block alone.
    explicit ZmScopedWatch(ZmWatch& watch, bool reset = false);
    ~ZmScopedWatch();
    ZmScopedWatch(const ZmScopedWatch&) = delete;
    ZmScopedWatch& operator=(const ZmScopedWatch&) = delete;

private:
    ZmWatch& m_watch;
    bool m_wasRunning;
};
