// The two text forms of a parameter tree, as strings.
#pragma once

#include "FileCapture.h"

#include <zmlib/HxParamBundle.h>
#include <zmlib/ZmString.h>

#include <string>

/// The form printed into a ZmString (no commas, transient children kept).
inline std::string printed(const HxParamBundle& b)
{
    ZmString out;
    b.print(out);
    return out.getString();
}

/// The form printed to a FILE stream (commas, transient children left out).
inline std::string printedToFile(const HxParamBundle& b)
{
    return writtenToFile([&](FILE* f) { b.print(f); });
}
