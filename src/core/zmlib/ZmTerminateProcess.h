/// \file
/// Ending the calling process at once.
#pragma once

#include <zmlib/ZmExport.h>

/// Ends the calling process immediately with exit status \p status: no exit handlers, no static
/// destructors, no flushing of buffered streams (the log's unwritten lines are lost too). Any
/// thread; does not return.
[[noreturn]] ZMLIB_API void ZmTerminateProcess(int status);
