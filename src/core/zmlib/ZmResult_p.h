/// \file
/// The system's error texts (private). ZmResult_posix.cpp implements it.
#pragma once

#include <cstddef>

/// The system's text for the error number \p error: a constant text, or one written to
/// \p buffer of \p size bytes. Never null; safe to call from several threads.
const char* zmSystemErrorText(int error, char* buffer, size_t size);
