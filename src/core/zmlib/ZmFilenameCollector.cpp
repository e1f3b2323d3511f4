#include <zmlib/ZmFilenameCollector.h>

#include <zmlib/ZmDirectory.h>
#include <zmlib/zmWildMatch.h>

namespace {

/// \p prefix is the path written before each name ("" or ending in '/'), \p dir what is listed.
bool collectBelow(const ZmString& dir, const ZmString& prefix, const char* pattern, ZmDArray<ZmString>& out)
{
    ZmDArray<ZmString> files;
    ZmDArray<ZmString> dirs;
    if (!ZmDirectory::scanSortedByName(dir.getString(), files, dirs, nullptr)) {
        return false;
    }
    for (const ZmString& name : files) {
        if (zmWildMatch(name.getString(), pattern)) {
            out.append(prefix + name);
        }
    }
    for (const ZmString& name : dirs) {
        const ZmString path = prefix + name;
        collectBelow(path, path + "/", pattern, out);
    }
    return true;
}

} // namespace

int ZmFilenameCollector::collect(ZmDArray<ZmString>& out) const
{
    return collect(out, m_startDir.getString(), m_fileName.getString());
}

int ZmFilenameCollector::collect(ZmDArray<ZmString>& out, const char* startDir, const char* pattern)
{
    out.clear();
    ZmString start(startDir);
    while (start.length() > 1 && start.getString()[start.length() - 1] == '/') {
        start.removeLast(1);
    }
    const bool current = start.isEmptyString();
    const ZmString prefix = current ? ZmString() : start == "/" ? start : start + "/";
    const char* match = pattern == nullptr || pattern[0] == 0 ? "*" : pattern;
    if (!collectBelow(current ? ZmString(".") : start, prefix, match, out)) {
        return -1;
    }
    return int(out.size());
}
