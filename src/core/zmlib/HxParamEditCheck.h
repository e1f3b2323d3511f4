/// \file
/// Which edits of a parameter tree a user interface may perform.
#pragma once

#include <zmlib/ZmExport.h>

class HxParamBase;
class HxParamBundle;
class HxParameter;

/// Decides whether an edit is allowed: each check answers non-zero for "allowed". The default
/// implementation answers from the protection flags of the object passed (for the insert checks,
/// of the bundle that would receive the child); derive to decide otherwise and attach the object
/// with `HxParamBase::setEditCheck` (it applies to the node and every node below that has no check
/// of its own). Holds no data.
class ZMLIB_API HxParamEditCheck {
public:
    HxParamEditCheck() = default;
    HxParamEditCheck(const HxParamEditCheck&) = default;
    HxParamEditCheck& operator=(const HxParamEditCheck&) = default;
    virtual ~HxParamEditCheck();

    /// Flag 0x0020 forbids.
    virtual int checkRename(HxParamBase* node, const char* newName);
    /// Flag 0x0004 forbids.
    virtual int checkDelete(HxParamBase* node);
    /// Flag 0x0008 of \p bundle forbids.
    virtual int checkInsertBundle(HxParamBundle* bundle, const char* name);
    /// Flag 0x0010 of \p bundle forbids.
    virtual int checkInsertParam(HxParamBundle* bundle, const char* name);
    /// Flag 0x0040 forbids.
    virtual int checkSetValue(HxParameter* parameter, const char* value);

    /// The one shared default check: made on first use, never freed.
    static HxParamEditCheck* defaultEditCheck();
};
