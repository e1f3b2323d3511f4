#include <zmlib/ZmLogFile.h>
#include <zmlib/ZmProcessInfo.h>
#include <zmlib/ZmString.h>

#include <cstdio>
#include <cstring>

// The figures come from /proc/<pid>/status: working set = VmRSS, its peak = VmHWM, committed
// memory = VmData, its peak = VmPeak (the largest virtual size, the nearest peak the kernel keeps).
ZmProcessInfo::ZmProcessInfo(int64_t processId)
{
    ZmString path(0, "/proc/%lld/status", static_cast<long long>(processId));
    FILE* file = std::fopen(path.getString(), "re");
    if (file == nullptr) {
        return;
    }
    struct Field {
        const char* key;
        uint64_t* value;
    };
    uint64_t values[4] = {0, 0, 0, 0};
    const Field fields[4] = {
        {"VmRSS:", &values[0]}, {"VmHWM:", &values[1]}, {"VmData:", &values[2]}, {"VmPeak:", &values[3]}};
    int seen = 0;
    char line[256];
    while (std::fgets(line, sizeof line, file) != nullptr) {
        for (const Field& f : fields) {
            const size_t n = std::strlen(f.key);
            unsigned long long kb = 0;
            if (std::strncmp(line, f.key, n) == 0 && std::sscanf(line + n, "%llu", &kb) == 1) {
                *f.value = uint64_t(kb) * 1024;
                ++seen;
            }
        }
    }
    std::fclose(file);
    // A zombie or a kernel thread has no memory lines: no snapshot.
    if (seen == 4) {
        m_found = true;
        m_workingSetSize = values[0];
        m_peakWorkingSetSize = values[1];
        m_pagefileUsage = values[2];
        m_peakPagefileUsage = values[3];
    }
}

void ZmProcessInfo::log() const
{
    if (m_found) {
        getTheLogInstance().tracef(ZmLogInfo, "ProcessInfo", "Working set size: %lldKb (peak %lldKb)",
                                   static_cast<long long>(m_workingSetSize / 1024),
                                   static_cast<long long>(m_peakWorkingSetSize / 1024));
    }
}
