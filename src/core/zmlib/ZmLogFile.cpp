#include <zmlib/ZmDirectory.h>
#include <zmlib/ZmFilename.h>
#include <zmlib/ZmLogFile.h>
#include <zmlib/ZmLogFile_p.h>
#include <zmlib/ZmMemory.h>
#include <zmlib/ZmMemoryException.h>
#include <zmlib/ZmMutex.h>
#include <zmlib/ZmTmpDir.h>
#include <zmlib/ZmWallClock_p.h>

#include <atomic>
#include <cctype>
#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <ctime>
#include <memory>

namespace {

// Sixteen times stdio's default: fewer write calls for a busy log.
constexpr size_t kFileBufferSize = 64 * 1024;

// Room for the longest stamp, with its terminator while it is formatted.
constexpr size_t kMaxStamp = 48;

// Another process may have made a file of the generated name; the name counter moves on each try.
constexpr int kMaxNameTries = 100;

// The letter of a trace line. Information lines carry a blank rather than "I", deliberately: the
// common case stays quiet, and readers of old logs rely on it.
char levelLetter(ZmLogLevel level)
{
    const char* s = ZmLogLevelToString(level);
    return level == ZmLogInfo || s[0] == 0 ? ' ' : s[0];
}

void appendText(ZmString& s, const char* text, size_t n)
{
    const int64_t len = s.length();
    s.resize(len + int64_t(n) + 1);
    std::memcpy(s.dataPtr() + len, text, n);
    s.dataPtr()[len + int64_t(n)] = 0;
}

void appendText(ZmString& s, const char* text)
{
    appendText(s, text, std::strlen(text));
}

} // namespace

namespace {

// The log never throws: a line that cannot get the memory it needs is dropped, and a file that
// cannot be opened for want of memory is not opened.
template <class F>
void dropOnMemoryFailure(F&& f) noexcept
{
    try {
        f();
    } catch (const ZmMemoryException&) {
    }
}

} // namespace

struct ZmLogFilePrivate {
    mutable ZmMutex mutex{true};
    std::string baseFolder ZM_GUARDED_BY(mutex);
    bool dateFoldersEnabled ZM_GUARDED_BY(mutex) = false;
    FILE* stream ZM_GUARDED_BY(mutex) = nullptr;
    FILE* consoleStream ZM_GUARDED_BY(mutex) = nullptr;
    ZmFilename filePath ZM_GUARDED_BY(mutex);
    int64_t maxNumLogFiles ZM_GUARDED_BY(mutex) = 40;
    uint64_t maxLogFileSizeInBytes ZM_GUARDED_BY(mutex) = 50000000;
    ZmLogFile::WriteCallback writeCallback ZM_GUARDED_BY(mutex) = nullptr;
    // Read without the lock to drop lines early; written under it.
    std::atomic<int> logLevel{ZmLogInfo};
    ZmLogLevel writeCallbackLogLevel ZM_GUARDED_BY(mutex) = ZmLogNone;
    bool consoleToLogEnabled ZM_GUARDED_BY(mutex) = false;
    bool logToConsoleEnabled ZM_GUARDED_BY(mutex) = false;
    ZmLogFile::DateTimeFormat dateTimeFormat ZM_GUARDED_BY(mutex) = ZmLogFile::TimeOfDay;
    // Points into `modules`: an interned name stays valid for the life of the process, so the
    // text defaultModule() hands out survives any later setDefaultModule.
    const char* defaultModule ZM_GUARDED_BY(mutex) = "";
    ZmDArray<char*> modules ZM_GUARDED_BY(mutex);
    int64_t bytesWritten ZM_GUARDED_BY(mutex) = 0;
    bool relativeTime ZM_GUARDED_BY(mutex) = false;
    int64_t relativeSeconds ZM_GUARDED_BY(mutex) = 0;
    int relativeMilliseconds ZM_GUARDED_BY(mutex) = 0;

    // The stamp of the last second stamped, up to its '.'.
    int64_t cachedSecond ZM_GUARDED_BY(mutex) = -1;
    ZmLogFile::DateTimeFormat cachedFormat ZM_GUARDED_BY(mutex) = ZmLogFile::NoDateTime;
    char cachedPrefix[kMaxStamp] ZM_GUARDED_BY(mutex);
    size_t cachedPrefixLength ZM_GUARDED_BY(mutex) = 0;
    // The line being formatted; reused under the lock so that a line costs no allocation.
    ZmString line ZM_GUARDED_BY(mutex);
    bool lineInUse ZM_GUARDED_BY(mutex) = false;

    /// Lines below the level are dropped before any formatting (read without the lock).
    bool drops(ZmLogLevel level) const;
    bool fullLocked() const ZM_REQUIRES(mutex)
    {
        return stream != nullptr && maxLogFileSizeInBytes != 0 &&
               uint64_t(bytesWritten) > maxLogFileSizeInBytes;
    }
    void writeLocked(ZmLogLevel level, const ZmString& text) ZM_REQUIRES(mutex);
    /// Writes the stamp (no terminator) to \p out, which has room for kMaxStamp bytes; returns
    /// its length.
    size_t stampLocked(char* out, ZmLogFile::DateTimeFormat format, const ZmWallTime& now) ZM_REQUIRES(mutex);
};

// --- levels ------------------------------------------------------------------------------------

const char* ZmLogLevelToString(ZmLogLevel level)
{
    switch (level) {
    case ZmLogDebug:
        return "D";
    case ZmLogInfo:
        return "I";
    case ZmLogWarning:
        return "W";
    case ZmLogError:
        return "E";
    case ZmLogCritical:
        return "C";
    default:
        return "";
    }
}

ZmLogLevel ZmLogLevelFromString(const char* s, bool* ok)
{
    ZmLogLevel level = ZmLogCritical;
    bool known = true;
    // Case does not matter: "warning" and "Warning" both name the warning level.
    switch (s == nullptr ? 0 : std::toupper(static_cast<unsigned char>(s[0]))) {
    case 'C':
        level = ZmLogCritical;
        break;
    case 'D':
        level = ZmLogDebug;
        break;
    case 'E':
        level = ZmLogError;
        break;
    case 'I':
        level = ZmLogInfo;
        break;
    case 'W':
        level = ZmLogWarning;
        break;
    default:
        known = false;
    }
    if (ok != nullptr) {
        *ok = known;
    }
    return level;
}

// --- instance ----------------------------------------------------------------------------------

ZmLogFile::ZmLogFile() : m_d(new ZmLogFilePrivate)
{
    m_d->baseFolder = ZmTmpDir::getSystemTmpPath();
    if (const char* count = std::getenv("KORVO_MAXNUMLOGFILES")) {
        m_d->maxNumLogFiles = std::atoi(count);
    }
    if (const char* debug = std::getenv("KORVO_DEBUG_LOG")) {
        if (std::atoi(debug) > 0) {
            m_d->logLevel = ZmLogDebug;
        }
    }
}

ZmLogFile::~ZmLogFile()
{
    close();
    if (m_d->consoleStream != nullptr) {
        std::fclose(m_d->consoleStream);
    }
    delete m_d;
}

ZmLogFile* ZmLogFile::createInstance()
{
    return new ZmLogFile;
}

ZmLogFile& ZmLogFile::getTheLogInstance()
{
    // Never destroyed: static destructors and threads still running at exit may log. The stdio
    // buffers are flushed by exit() itself.
    static ZmLogFile* const instance = createInstance();
    return *instance;
}

ZmLogFile& getTheLogInstance()
{
    return ZmLogFile::getTheLogInstance();
}

// --- writing -----------------------------------------------------------------------------------

size_t ZmLogFilePrivate::stampLocked(char* out, ZmLogFile::DateTimeFormat format, const ZmWallTime& now)
{
    if (format != ZmLogFile::TimeOfDay && format != ZmLogFile::DateAndTime) {
        return 0;
    }
    int ms = int(now.nanoseconds / 1000000);
    if (format == ZmLogFile::TimeOfDay && relativeTime) {
        int64_t seconds = now.seconds - relativeSeconds;
        ms -= relativeMilliseconds;
        if (ms < 0) {
            ms += 1000;
            --seconds;
        }
        return size_t(std::snprintf(out, kMaxStamp, "%02d:%02d:%02d.%03d", int(seconds / 3600 % 24),
                                    int(seconds / 60 % 60), int(seconds % 60), ms));
    }
    if (now.seconds != cachedSecond || format != cachedFormat) {
        // The stamp up to the seconds changes once a second: format it then, not on every line.
        const std::tm t = zmLocalTime(now.seconds);
        if (format == ZmLogFile::TimeOfDay) {
            cachedPrefixLength = size_t(std::snprintf(cachedPrefix, sizeof cachedPrefix, "%02d:%02d:%02d.",
                                                      t.tm_hour, t.tm_min, t.tm_sec));
        } else {
            cachedPrefixLength = size_t(
                std::snprintf(cachedPrefix, sizeof cachedPrefix, "%04d-%02d-%02d %02d:%02d:%02d.",
                              t.tm_year + 1900, t.tm_mon + 1, t.tm_mday, t.tm_hour, t.tm_min, t.tm_sec));
        }
        cachedSecond = now.seconds;
        cachedFormat = format;
    }
    std::memcpy(out, cachedPrefix, cachedPrefixLength);
    out[cachedPrefixLength] = char('0' + ms / 100);
    out[cachedPrefixLength + 1] = char('0' + ms / 10 % 10);
    out[cachedPrefixLength + 2] = char('0' + ms % 10);
    return cachedPrefixLength + 3;
}

void ZmLogFilePrivate::writeLocked(ZmLogLevel level, const ZmString& text)
{
    const char* s = text.getString();
    const size_t n = size_t(text.length());
    const bool addLineFeed = n == 0 || s[n - 1] != '\n';
    if (stream != nullptr && !consoleToLogEnabled) {
        // The log's own mutex guards its stream: stdio's lock would only be taken twice.
        fwrite_unlocked(s, 1, n, stream);
        if (addLineFeed) {
            fputc_unlocked('\n', stream);
        }
        if (logToConsoleEnabled) {
            std::fwrite(s, 1, n, stdout);
            if (addLineFeed) {
                std::fputc('\n', stdout);
            }
        }
    } else {
        std::fwrite(s, 1, n, stdout);
        if (addLineFeed) {
            std::fputc('\n', stdout);
        }
    }
    bytesWritten += int64_t(n) + (addLineFeed ? 1 : 0);
    if (level >= ZmLogError && stream != nullptr) {
        // Errors reach the disk at once: they are what one reads after a crash.
        std::fflush(stream);
    }
    if (writeCallback != nullptr && level >= writeCallbackLogLevel) {
        if (addLineFeed) {
            ZmString withLineFeed(text);
            withLineFeed += '\n';
            writeCallback(level, withLineFeed);
        } else {
            writeCallback(level, text);
        }
    }
}

namespace {

// writeLine with the lock already held (the formatting members hold it while they build the line).
void writeLineLocked(ZmLogFile& log, ZmLogFilePrivate& d, ZmLogLevel level, const ZmString& line)
    ZM_REQUIRES(d.mutex)
{
    if (level < d.logLevel.load(std::memory_order_relaxed)) {
        return;
    }
    if (d.fullLocked()) {
        log.chunkTryOpenNext();
    }
    d.writeLocked(level, line);
}

} // namespace

void ZmLogFile::writeLine(ZmLogLevel level, const ZmString& line)
{
    ZmMutexLocker lock(m_d->mutex);
    // The analysis does not follow the lock into a lambda; this one runs at once, inside it.
    dropOnMemoryFailure([&]() ZM_NO_THREAD_SAFETY_ANALYSIS { writeLineLocked(*this, *m_d, level, line); });
}

namespace {

// The line buffer for one call. A call made while the shared buffer is in use (the first line of
// a continued file, a callback that logs) gets a buffer of its own.
class LineBuffer {
public:
    explicit LineBuffer(ZmLogFilePrivate& d) ZM_REQUIRES(d.mutex)
        : m_d(d), m_wasInUse(d.lineInUse), m_own(m_wasInUse ? new ZmString : nullptr),
          m_line(m_wasInUse ? *m_own : d.line)
    {
        d.lineInUse = true;
        m_line.clear();
    }
    // Runs where the constructor ran: inside the same lock.
    ~LineBuffer() ZM_NO_THREAD_SAFETY_ANALYSIS { m_d.lineInUse = m_wasInUse; }
    LineBuffer(const LineBuffer&) = delete;
    LineBuffer& operator=(const LineBuffer&) = delete;
    ZmString& line() { return m_line; }

private:
    ZmLogFilePrivate& m_d;
    bool m_wasInUse;
    std::unique_ptr<ZmString> m_own; // only for a nested call: the common path allocates nothing
    ZmString& m_line;
};

// Builds "<stamp>: <letter> [<module>] " into line; the message follows. One capacity check and
// plain stores: this runs for every line.
void beginLine(ZmLogFilePrivate& d, ZmString& line, ZmLogLevel level, const char* module,
               const ZmWallTime& now) ZM_REQUIRES(d.mutex)
{
    const char* name = module != nullptr && module[0] != 0 ? module : d.defaultModule;
    const size_t nameLength = std::strlen(name);
    const int64_t need = int64_t(kMaxStamp + 8 + nameLength);
    if (line.getMax() < need) {
        line.remax(need, -1);
    }
    char* const start = line.dataPtr();
    char* p = start + d.stampLocked(start, d.dateTimeFormat, now);
    if (p != start) {
        *p++ = ':';
        *p++ = ' ';
    }
    *p++ = levelLetter(level);
    *p++ = ' ';
    *p++ = '[';
    std::memcpy(p, name, nameLength);
    p += nameLength;
    *p++ = ']';
    *p++ = ' ';
    *p = 0;
    line.resize(p - start + 1);
}

} // namespace

namespace {

// A message formatted before the lock is taken, so that threads format in parallel and the lock
// is held only to stamp and write. Short messages stay on the stack.
class Formatted {
public:
    Formatted(const char* format, va_list args)
    {
        if (format == nullptr) {
            return;
        }
        va_list again;
        va_copy(again, args);
        const int n = std::vsnprintf(m_stack, sizeof m_stack, format, args);
        if (n < 0) {
            m_stack[0] = 0;
        } else if (size_t(n) < sizeof m_stack) {
            m_length = size_t(n);
        } else {
            m_heap.reset(new char[size_t(n) + 1]);
            std::vsnprintf(m_heap.get(), size_t(n) + 1, format, again);
            m_text = m_heap.get();
            m_length = size_t(n);
        }
        va_end(again);
    }
    Formatted(const Formatted&) = delete;
    Formatted& operator=(const Formatted&) = delete;
    const char* text() const { return m_text; }
    size_t length() const { return m_length; }

private:
    char m_stack[512] = {};
    std::unique_ptr<char[]> m_heap;
    const char* m_text = m_stack;
    size_t m_length = 0;
};

// One tagged line: stamp and tag, the message, its line feed.
void traceText(ZmLogFile& log, ZmLogFilePrivate& d, ZmLogLevel level, const char* module, const char* text,
               size_t length)
{
    // The clock is read before the lock, as the message was formatted: the lock is held only to
    // build and write the line. Lines of different threads may then differ from their stamps'
    // order by the time a thread waits for the lock.
    const ZmWallTime now = zmWallClock();
    ZmMutexLocker lock(d.mutex);
    LineBuffer buffer(d);
    beginLine(d, buffer.line(), level, module, now);
    appendText(buffer.line(), text, length);
    // Many messages end in their own line feed; a line gets exactly one.
    if (length == 0 || text[length - 1] != '\n') {
        appendText(buffer.line(), "\n", 1);
    }
    writeLineLocked(log, d, level, buffer.line());
}

// One plain line: the text alone (writeLine adds the line feed).
void printText(ZmLogFile& log, ZmLogFilePrivate& d, const char* prefix, const char* text, size_t length)
{
    ZmMutexLocker lock(d.mutex);
    LineBuffer buffer(d);
    appendText(buffer.line(), prefix);
    appendText(buffer.line(), text, length);
    writeLineLocked(log, d, ZmLogInfo, buffer.line());
}

} // namespace

bool ZmLogFilePrivate::drops(ZmLogLevel level) const
{
    return level < logLevel.load(std::memory_order_relaxed);
}

void ZmLogFile::trace(ZmLogLevel level, const char* module, const char* message)
{
    if (!m_d->drops(level)) {
        message = message != nullptr ? message : "";
        dropOnMemoryFailure([&] { traceText(*this, *m_d, level, module, message, std::strlen(message)); });
    }
}

namespace {

void vtrace(ZmLogFile& log, ZmLogFilePrivate& d, ZmLogLevel level, const char* module, const char* format,
            va_list args)
{
    if (!d.drops(level)) {
        dropOnMemoryFailure([&] {
            const Formatted message(format, args);
            traceText(log, d, level, module, message.text(), message.length());
        });
    }
}

} // namespace

void ZmLogFile::tracef(ZmLogLevel level, const char* module, const char* format, ...)
{
    va_list args;
    va_start(args, format);
    vtrace(*this, *m_d, level, module, format, args);
    va_end(args);
}

void ZmLogFile::errorf(const char* format, ...)
{
    va_list args;
    va_start(args, format);
    vtrace(*this, *m_d, ZmLogError, nullptr, format, args);
    va_end(args);
}

void ZmLogFile::warnf(const char* format, ...)
{
    va_list args;
    va_start(args, format);
    vtrace(*this, *m_d, ZmLogWarning, nullptr, format, args);
    va_end(args);
}

void ZmLogFile::print(const char* module, const char* message)
{
    if (m_d->drops(ZmLogInfo)) {
        return;
    }
    message = message != nullptr ? message : "";
    dropOnMemoryFailure([&] {
        ZmString prefix;
        if (module != nullptr && module[0] != 0) {
            prefix.printf("[%s] ", module);
        }
        printText(*this, *m_d, prefix.getString(), message, std::strlen(message));
    });
}

void ZmLogFile::printf(const char* format, ...)
{
    if (m_d->drops(ZmLogInfo) || format == nullptr) {
        return;
    }
    va_list args;
    va_start(args, format);
    dropOnMemoryFailure([&] {
        const Formatted message(format, args);
        printText(*this, *m_d, "", message.text(), message.length());
    });
    va_end(args);
}

void ZmLogFile::writeCharBuffer(const char* text)
{
    if (text == nullptr) {
        return;
    }
    ZmMutexLocker lock(m_d->mutex);
    const size_t n = std::strlen(text);
    if (m_d->stream != nullptr && !m_d->consoleToLogEnabled) {
        std::fwrite(text, 1, n, m_d->stream);
        m_d->bytesWritten += int64_t(n);
        if (m_d->logToConsoleEnabled) {
            std::fprintf(stdout, "%s", text);
        }
    } else {
        // Nothing is lost while no file is open: the text goes where the lines go.
        std::fwrite(text, 1, n, stdout);
    }
    flush();
}

bool ZmLogFile::append(ZmString text)
{
    ZmMutexLocker lock(m_d->mutex);
    writeCharBuffer(text.getString());
    return m_d->stream != nullptr;
}

void ZmLogFile::flush()
{
    ZmMutexLocker lock(m_d->mutex);
    if (m_d->stream != nullptr) {
        std::fflush(m_d->stream);
    }
    std::fflush(stdout);
}

void ZmLogFile::close()
{
    ZmMutexLocker lock(m_d->mutex);
    if (m_d->stream != nullptr) {
        std::fclose(m_d->stream);
        m_d->stream = nullptr;
    }
}

bool ZmLogFile::isOpen() const
{
    ZmMutexLocker lock(m_d->mutex);
    return m_d->stream != nullptr;
}

ZmString ZmLogFile::filePath() const
{
    ZmMutexLocker lock(m_d->mutex);
    return m_d->filePath;
}

// --- files -------------------------------------------------------------------------------------

namespace {

void cleanUpLocked(ZmLogFilePrivate& d, const ZmString* keep) ZM_REQUIRES(d.mutex)
{
    // A negative limit (a typo in the environment, a bad setter call) means no clean-up, like 0:
    // read as a count it would make every log file of the folder "excess".
    if (d.maxNumLogFiles <= 0 || d.dateFoldersEnabled) {
        return;
    }
    ZmString folder(d.baseFolder.c_str());
    ZmDArray<ZmString> names;
    ZmDirectory::scanSortedByName(folder.getString(), names, "*.log", false);
    if (folder.length() != 0 && folder[folder.length() - 1] != '/') {
        folder += '/';
    }
    ZmDArray<ZmString> paths;
    for (const ZmString& name : names) {
        ZmString path = folder + name;
        if (keep == nullptr || path != *keep) {
            paths.append(path);
        }
    }
    // One place stays free for the file about to be opened.
    const int64_t excess = paths.size() - d.maxNumLogFiles + 1;
    for (int64_t i = 0; i < excess && i < paths.size(); ++i) {
        ZmFilename log(paths[i]);
        log.unlink();
        // A crash dump written beside a log goes with it.
        ZmFilename dump(ZmString(paths[i].getString(), 0, paths[i].length() - 4) + ".dmp");
        dump.unlink();
    }
}

} // namespace

void ZmLogFile::cleanUp()
{
    ZmMutexLocker lock(m_d->mutex);
    // The analysis does not follow the lock into a lambda; this one runs at once, inside it.
    dropOnMemoryFailure([&]() ZM_NO_THREAD_SAFETY_ANALYSIS { cleanUpLocked(*m_d, nullptr); });
}

bool ZmLogFile::open(bool force)
{
    ZmMutexLocker lock(m_d->mutex);
    try {
        return openUnguarded(force);
    } catch (const ZmMemoryException&) {
        // Out of memory part of the way (the clean-up runs after the new file is in place):
        // whether a stream is open now is the answer, as on every other path.
        return m_d->stream != nullptr;
    }
}

bool ZmLogFile::openUnguarded(bool force)
{
    ZmMutexLocker lock(m_d->mutex);
    if (!force && m_d->stream != nullptr) {
        return false;
    }
    ZmString folder;
    ZmString name;
    ZmFilename path;
    FILE* stream = nullptr;
    for (int attempt = 0; attempt < kMaxNameTries && stream == nullptr; ++attempt) {
        if (!ZmFilename::generateFilePath(folder, name, ZmString(m_d->baseFolder.c_str()),
                                          m_d->dateFoldersEnabled, true)) {
            return false;
        }
        path.printf("%s/%s.log", folder.getString(), name.getString());
        // "x": never take over a file that another process has just made under the same name.
        stream = std::fopen(path.getString(), "wx");
        if (stream == nullptr && errno != EEXIST) {
            return false;
        }
    }
    if (stream == nullptr) {
        return false;
    }
    // The handle on the terminal is opened on the first open and kept, as the log always has: it
    // still reaches the terminal after the console has been redirected into the log. The log
    // itself never writes to it. Started programs do not inherit it.
    if (m_d->consoleStream == nullptr) {
        m_d->consoleStream = zmLogOpenConsole();
    }
    close();
    std::setvbuf(stream, nullptr, _IOFBF, kFileBufferSize);
    m_d->stream = stream;
    // The new file is already there; it is not one of the files to prune.
    cleanUpLocked(*m_d, &path);
    if (m_d->consoleToLogEnabled) {
        std::fflush(stdout);
        std::fflush(stderr);
        if (std::freopen(path.getString(), "a", stdout) != nullptr) {
            zmLogRedirectStandardError();
        }
    }
    m_d->filePath = path;
    m_d->bytesWritten = 0;
    return true;
}

bool ZmLogFile::chunkIsFull() const
{
    ZmMutexLocker lock(m_d->mutex);
    return m_d->fullLocked();
}

bool ZmLogFile::chunkTryOpenNext()
{
    ZmMutexLocker lock(m_d->mutex);
    const ZmString previous = m_d->filePath;
    if (!open(true)) {
        return false;
    }
    printf("This file continues %s", previous.getString());
    return true;
}

// --- settings ----------------------------------------------------------------------------------

ZmLogLevel ZmLogFile::logLevel() const
{
    return ZmLogLevel(m_d->logLevel.load());
}

void ZmLogFile::setLogLevel(ZmLogLevel level)
{
    ZmMutexLocker lock(m_d->mutex);
    m_d->logLevel = level;
}

#define ZM_LOG_SETTING(Type, getter, setter, field)                                                          \
    Type ZmLogFile::getter() const                                                                           \
    {                                                                                                        \
        ZmMutexLocker lock(m_d->mutex);                                                                      \
        return m_d->field;                                                                                   \
    }                                                                                                        \
    void ZmLogFile::setter(Type value)                                                                       \
    {                                                                                                        \
        ZmMutexLocker lock(m_d->mutex);                                                                      \
        m_d->field = value;                                                                                  \
    }

ZM_LOG_SETTING(int64_t, maxNumLogFiles, setMaxNumLogFiles, maxNumLogFiles)
ZM_LOG_SETTING(uint64_t, maxLogFileSizeInBytes, setMaxLogFileSizeInBytes, maxLogFileSizeInBytes)
ZM_LOG_SETTING(bool, dateFoldersEnabled, setDateFoldersEnabled, dateFoldersEnabled)
ZM_LOG_SETTING(bool, consoleToLogEnabled, setConsoleToLogEnabled, consoleToLogEnabled)
ZM_LOG_SETTING(bool, logToConsoleEnabled, setLogToConsoleEnabled, logToConsoleEnabled)
ZM_LOG_SETTING(ZmLogFile::DateTimeFormat, dateTimeFormat, setDateTimeFormat, dateTimeFormat)
#undef ZM_LOG_SETTING

std::string ZmLogFile::baseFolder() const
{
    ZmMutexLocker lock(m_d->mutex);
    return m_d->baseFolder;
}

void ZmLogFile::setBaseFolder(const std::string& folder)
{
    ZmMutexLocker lock(m_d->mutex);
    m_d->baseFolder = folder;
}

const char* ZmLogFile::defaultModule() const
{
    ZmMutexLocker lock(m_d->mutex);
    return m_d->defaultModule;
}

void ZmLogFile::setDefaultModule(const char* module)
{
    ZmMutexLocker lock(m_d->mutex);
    if (module == nullptr || module[0] == 0) {
        m_d->defaultModule = "";
        return;
    }
    ZmDArray<char*>& modules = m_d->modules;
    for (char* known : modules) {
        if (std::strcmp(known, module) == 0) {
            m_d->defaultModule = known;
            return;
        }
    }
    // A new name is interned and never freed. Module names are a small fixed set in practice;
    // one that keeps growing is worth a warning, once.
    static constexpr int64_t kManyModules = 1024;
    try {
        const size_t n = std::strlen(module) + 1;
        modules.remax(modules.size() + 1, -1); // room first: the copy below cannot be lost
        char* copy = static_cast<char*>(zmmalloc(n));
        std::memcpy(copy, module, n);
        modules.append(copy);
        m_d->defaultModule = copy;
    } catch (const ZmMemoryException&) {
        return; // the log never throws: the old default module stays
    }
    if (modules.size() == kManyModules) {
        warnf("ZmLogFile::setDefaultModule(): %lld distinct module names are kept for the life of "
              "the process; module names should be a fixed set\n",
              static_cast<long long>(kManyModules));
    }
}

ZmLogFile::WriteCallback ZmLogFile::writeCallback() const
{
    ZmMutexLocker lock(m_d->mutex);
    return m_d->writeCallback;
}

ZmLogLevel ZmLogFile::writeCallbackLogLevel() const
{
    ZmMutexLocker lock(m_d->mutex);
    return m_d->writeCallbackLogLevel;
}

void ZmLogFile::setWriteCallback(WriteCallback callback, ZmLogLevel level)
{
    ZmMutexLocker lock(m_d->mutex);
    m_d->writeCallback = callback;
    m_d->writeCallbackLogLevel = level;
}

bool ZmLogFile::debugEnabled() const
{
    ZmMutexLocker lock(m_d->mutex);
    return m_d->logLevel == ZmLogDebug || m_d->writeCallbackLogLevel == ZmLogDebug;
}

void ZmLogFile::resetTimeStamp()
{
    const ZmWallTime now = zmWallClock();
    ZmMutexLocker lock(m_d->mutex);
    m_d->relativeTime = true;
    m_d->relativeSeconds = now.seconds;
    m_d->relativeMilliseconds = int(now.nanoseconds / 1000000);
}

void ZmLogFile::timeString(ZmString& out, DateTimeFormat format) const
{
    char stamp[kMaxStamp];
    ZmMutexLocker lock(m_d->mutex);
    const ZmWallTime now = zmWallClock();
    out = ZmString(stamp, 0, int(m_d->stampLocked(stamp, format, now)));
}

// --- helpers -----------------------------------------------------------------------------------

ZmLogFileDefaultModuleModifier::ZmLogFileDefaultModuleModifier(const char* module)
    : m_previous(getTheLogInstance().defaultModule()) // interned: stays valid
{
    getTheLogInstance().setDefaultModule(module);
}

ZmLogFileDefaultModuleModifier::~ZmLogFileDefaultModuleModifier()
{
    getTheLogInstance().setDefaultModule(m_previous);
}

void ZmLogFileWriteCallbackDisabler::disableWriteCallback()
{
    if (m_disabled) {
        return;
    }
    ZmLogFile& log = getTheLogInstance();
    m_callback = log.writeCallback();
    m_level = log.writeCallbackLogLevel();
    log.setWriteCallback(nullptr, m_level);
    m_disabled = true;
}

void ZmLogFileWriteCallbackDisabler::restoreWriteCallback()
{
    if (!m_disabled) {
        return;
    }
    getTheLogInstance().setWriteCallback(m_callback, m_level);
    m_disabled = false;
}
