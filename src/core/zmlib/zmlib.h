/// \file
/// Umbrella header: includes every public header of the library.
#pragma once

#include <zmlib/StringUtils.h>
#include <zmlib/ZmAllocator.h>
#include <zmlib/ZmBitfield.h>
#include <zmlib/ZmDArray.h>
#include <zmlib/ZmException.h>
#include <zmlib/ZmExport.h>
#include <zmlib/ZmMemory.h>
#include <zmlib/ZmMemoryException.h>
#include <zmlib/ZmStdStringTokenizer.h>
#include <zmlib/ZmString.h>
#include <zmlib/ZmStringTokenizer.h>
#include <zmlib/ZmStringTokenizerGeneral.h>
#include <zmlib/zmWildMatch.h>
#include <zmlib/zmlibVersion.h>
