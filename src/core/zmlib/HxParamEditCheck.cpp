#include <zmlib/HxParamEditCheck.h>

#include <zmlib/HxParamBundle.h>

HxParamEditCheck::~HxParamEditCheck() = default;

int HxParamEditCheck::checkRename(HxParamBase* node, const char*)
{
    return node != nullptr && node->flag(HxParamBase::NO_RENAME) == 0;
}

int HxParamEditCheck::checkDelete(HxParamBase* node)
{
    return node != nullptr && node->flag(HxParamBase::NO_DELETE) == 0;
}

int HxParamEditCheck::checkInsertBundle(HxParamBundle* bundle, const char*)
{
    return bundle != nullptr && bundle->flag(HxParamBase::NO_INSERT_BUNDLE) == 0;
}

int HxParamEditCheck::checkInsertParam(HxParamBundle* bundle, const char*)
{
    return bundle != nullptr && bundle->flag(HxParamBase::NO_INSERT_PARAMETER) == 0;
}

int HxParamEditCheck::checkSetValue(HxParameter* parameter, const char*)
{
    return parameter != nullptr && parameter->flag(HxParamBase::NO_SET_VALUE) == 0;
}

HxParamEditCheck* HxParamEditCheck::defaultEditCheck()
{
    // Made on first use and kept for the life of the process: nodes anywhere may point at it.
    static HxParamEditCheck* const check = new HxParamEditCheck;
    return check;
}
