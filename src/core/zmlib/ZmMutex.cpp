#include <zmlib/ZmLogFile.h>
#include <zmlib/ZmMutex.h>

// The portable part of ZmMutex; the platform calls are in ZmMutex_posix.cpp.

void ZmMutex::unlockFailed(int rc)
{
    getTheLogInstance().errorf("ZmMutex::unlock() failed (error code: %d)\n", rc);
}
