#include <zmlib/ZmDirectory.h>

#include <zmlib/ZmDirectory_p.h>
#include <zmlib/ZmFilename.h>

#include <cstring>

namespace {

using Entry = ZmDirectoryEntry;

/// The listing behind every scan: the entries of \p dir matching \p pattern, in system order.
int readEntries(const char* dir, const char* pattern, bool directoriesOnly, ZmDArray<Entry>& out)
{
    out.clear();
    if (dir == nullptr || dir[0] == 0) {
        return -1;
    }
    const char last = dir[std::strlen(dir) - 1];
    const ZmString search(0, last == '/' || last == '\\' ? "%s%s" : "%s/%s", dir,
                          pattern != nullptr ? pattern : "*");
    // The pattern is the last component of the search path; the rest names the directory.
    ZmString folder;
    ZmFilename::dirname(search.getString(), folder);
    return zmReadDirectory(folder.getString(), ZmFilename::basename(search.getString()), directoriesOnly,
                           out);
}

int byName(const Entry& a, const Entry& b)
{
    return std::strcmp(a.info.name.getString(), b.info.name.getString());
}

int byCreationTime(const Entry& a, const Entry& b)
{
    if (a.info.creationTime != b.info.creationTime) {
        return a.info.creationTime < b.info.creationTime ? -1 : 1;
    }
    return byName(a, b);
}

} // namespace

int ZmDirectory::scan(const char* dir, std::vector<FileInfo>& list, const char* pattern, bool directoriesOnly)
{
    list.clear();
    ZmDArray<Entry> entries;
    const int n = readEntries(dir, pattern, directoriesOnly, entries);
    for (const Entry& e : entries) {
        list.push_back(e.info);
    }
    return n;
}

int ZmDirectory::scanSortedByName(const char* dir, ZmDArray<ZmString>& names, const char* pattern,
                                  bool directoriesOnly)
{
    names.clear();
    ZmDArray<Entry> entries;
    const int n = readEntries(dir, pattern, directoriesOnly, entries);
    entries.sort(byName);
    for (const Entry& e : entries) {
        names.append(e.info.name);
    }
    return n;
}

bool ZmDirectory::scanSortedByName(const char* dir, ZmDArray<ZmString>& files, ZmDArray<ZmString>& dirs,
                                   const char* pattern)
{
    files.clear();
    dirs.clear();
    ZmDArray<Entry> entries;
    if (readEntries(dir, pattern, false, entries) < 0) {
        return false;
    }
    entries.sort(byName);
    for (const Entry& e : entries) {
        (e.isDirectory ? dirs : files).append(e.info.name);
    }
    return true;
}

int ZmDirectory::scanSortedByCreationTime(const char* dir, ZmDArray<ZmString>& names,
                                          ZmDArray<uint64_t>* times, const char* pattern,
                                          bool directoriesOnly)
{
    names.clear();
    if (times != nullptr) {
        times->clear();
    }
    ZmDArray<Entry> entries;
    const int n = readEntries(dir, pattern, directoriesOnly, entries);
    entries.sort(byCreationTime);
    for (const Entry& e : entries) {
        names.append(e.info.name);
        if (times != nullptr) {
            times->append(e.info.creationTime);
        }
    }
    return n;
}
