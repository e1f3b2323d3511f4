/// \file
/// The process log: levels, the log file and its helpers.
#pragma once

#include <zmlib/ZmExport.h>
#include <zmlib/ZmString.h>

#include <cstdint>
#include <string>

/// Severity of a log line. Lines below the log's level are dropped.
enum ZmLogLevel : int {
    ZmLogDebug = 0,
    ZmLogInfo = 1,
    ZmLogWarning = 2,
    ZmLogError = 3,
    ZmLogCritical = 4,
    /// Above every level: a callback with this level receives nothing.
    ZmLogNone = 5
};

/// "D", "I", "W", "E", "C"; the empty text for any other value.
ZMLIB_API const char* ZmLogLevelToString(ZmLogLevel level);
/// Decided by the first character only, in either case (C, D, E, I, W); anything else, or null, gives
/// `ZmLogCritical` with `*ok` false. \p ok may be null.
ZMLIB_API ZmLogLevel ZmLogLevelFromString(const char* s, bool* ok = nullptr);

struct ZmLogFilePrivate;

/// The process-wide diagnostic log: one instance, reached through `getTheLogInstance()`.
///
/// Lines are written as "<stamp>: <letter> [<module>] <text>" (the letter of `ZmLogLevelToString`,
/// except that information lines carry a blank where "I" would stand) to a log file in the base folder
/// (by default the system temporary folder) once `open()` has been called, and to standard output
/// before that or when the file cannot be opened. A file that grows beyond the size limit is
/// continued in a new one whose first line names the old one; opening prunes the oldest log files
/// beyond the count limit. Each line at or above the callback level is also handed to one write
/// callback. The file is written through a large buffer; lines at error level and above are
/// flushed at once.
///
/// Every public member takes one recursive mutex, so it may be used from any thread and lines of
/// different threads never interleave. The callback runs with that lock held: it must not wait for
/// another thread that logs. The log never throws and reports failure only through `open()`.
///
/// Environment: KORVO_MAXNUMLOGFILES sets the count limit (default 40); KORVO_DEBUG_LOG greater
/// than 0 lowers the level to debug. Both are read once, when the instance is made.
class ZMLIB_API ZmLogFile {
public:
    /// Time stamp of each line; any other value gives no stamp.
    enum DateTimeFormat : int {
        NoDateTime = 0,
        /// "%02d:%02d:%02d.%03d", hours to milliseconds.
        TimeOfDay = 1,
        /// "%04d-%02d-%02d %02d:%02d:%02d.%03d".
        DateAndTime = 2
    };
    using WriteCallback = void (*)(ZmLogLevel level, const ZmString& line);

    /// The single instance, made on first use and never destroyed (it outlives every static).
    static ZmLogFile& getTheLogInstance();

    ZmLogFile(const ZmLogFile&) = delete;
    ZmLogFile& operator=(const ZmLogFile&) = delete;

    // --- writing; module and message may be null ------------------------------------------------

    /// One line at \p level; \p module null or empty uses the default module.
    void trace(ZmLogLevel level, const char* module, const char* message);
    void tracef(ZmLogLevel level, const char* module, const char* format, ...) ZMLIB_PRINTF(4, 5);
    void error(const char* module, const char* message) { trace(ZmLogError, module, message); }
    void errorf(const char* format, ...) ZMLIB_PRINTF(2, 3);
    void warn(const char* module, const char* message) { trace(ZmLogWarning, module, message); }
    void warnf(const char* format, ...) ZMLIB_PRINTF(2, 3);
    /// A plain line at information level: no stamp and no level letter, "[module] " first when a
    /// module is given.
    void print(const char* module, const char* message);
    /// A plain line at information level: the formatted text alone.
    void printf(const char* format, ...) ZMLIB_PRINTF(2, 3);

    /// Writes a formatted line (a line feed is added unless it ends with one), starting the next
    /// file first when the current one is full.
    void writeLine(ZmLogLevel level, const ZmString& line);
    /// Writes \p text as it stands to the file (or standard output), then flushes.
    void writeCharBuffer(const char* text);
    /// Adds \p text as it stands, without stamp or line feed; true when it went into a log file,
    /// false when it went to standard output.
    bool append(ZmString text);

    /// Flushes the file and standard output.
    void flush();
    /// Closes the file; later lines go to standard output until the next `open()`. The console
    /// handle stays open.
    void close();
    bool isOpen() const;
    /// Opens a new file with a generated name in the base folder (or today's folder below it).
    /// Without \p force an open log is left alone and false returned. When the new file cannot be
    /// created the current state is kept and false returned.
    bool open(bool force = false);
    /// Deletes the oldest "*.log" files (and the ".dmp" beside each) so that one more fits within
    /// the count limit. Nothing with a limit of 0 or with date folders. Every "*.log" of the base
    /// folder counts, whoever wrote it: give the log a folder of its own rather than the shared
    /// temporary folder it starts with.
    void cleanUp();
    /// The open file's path; empty before the first `open()`.
    ZmString filePath() const;

    /// Starts the next file when the current one is full; true when one was started.
    bool chunkTryOpenNext();
    /// A file is open, the size limit is not 0 and the bytes written exceed it.
    bool chunkIsFull() const;

    // --- settings -------------------------------------------------------------------------------

    ZmLogLevel logLevel() const;
    void setLogLevel(ZmLogLevel level);
    /// How many log files the clean-up leaves in the base folder; 0 or a negative count (from the
    /// setter or KORVO_MAXNUMLOGFILES) disables the clean-up.
    int64_t maxNumLogFiles() const;
    void setMaxNumLogFiles(int64_t count);
    uint64_t maxLogFileSizeInBytes() const;
    void setMaxLogFileSizeInBytes(uint64_t bytes);
    std::string baseFolder() const;
    void setBaseFolder(const std::string& folder);
    bool dateFoldersEnabled() const;
    void setDateFoldersEnabled(bool enabled);
    /// Standard output and standard error are redirected into the log file (from the next open).
    bool consoleToLogEnabled() const;
    void setConsoleToLogEnabled(bool enabled);
    /// Every line is also printed on standard output.
    bool logToConsoleEnabled() const;
    void setLogToConsoleEnabled(bool enabled);
    DateTimeFormat dateTimeFormat() const;
    void setDateTimeFormat(DateTimeFormat format);
    /// The module used when a call gives none (the returned text is valid until it is changed).
    /// The module named by lines that give none ("" when unset). The text stays valid for the life
    /// of the process, whatever is set later: names are interned, so keep them a fixed set.
    const char* defaultModule() const;
    void setDefaultModule(const char* module);
    WriteCallback writeCallback() const;
    ZmLogLevel writeCallbackLogLevel() const;
    void setWriteCallback(WriteCallback callback, ZmLogLevel level);
    /// The log level or the callback level is debug.
    bool debugEnabled() const;

    /// Makes later time-of-day stamps relative to now.
    void resetTimeStamp();
    /// The stamp of the current time in \p format (empty for no stamp).
    void timeString(ZmString& out, DateTimeFormat format) const;

private:
    ZmLogFile();
    ~ZmLogFile();
    static ZmLogFile* createInstance();
    /// `open()` without its guard against running out of memory.
    bool openUnguarded(bool force);

    ZmLogFilePrivate* m_d;
};

/// The same instance as `ZmLogFile::getTheLogInstance()`.
ZMLIB_API ZmLogFile& getTheLogInstance();

/// Sets the default module for a scope and restores the previous one.
class ZMLIB_API ZmLogFileDefaultModuleModifier {
public:
    explicit ZmLogFileDefaultModuleModifier(const char* module);
    ~ZmLogFileDefaultModuleModifier();
    ZmLogFileDefaultModuleModifier(const ZmLogFileDefaultModuleModifier&) = delete;
    ZmLogFileDefaultModuleModifier& operator=(const ZmLogFileDefaultModuleModifier&) = delete;

private:
    const char* m_previous;
};

/// Takes the write callback away and gives it back, keeping its level.
///
/// `restoreWriteCallback()` without a preceding `disableWriteCallback()` does nothing; so does a
/// second `disableWriteCallback()` (the callback first taken is the one restored).
class ZMLIB_API ZmLogFileWriteCallbackDisabler {
public:
    ZmLogFileWriteCallbackDisabler() = default;
    void disableWriteCallback();
    void restoreWriteCallback();

private:
    ZmLogFile::WriteCallback m_callback = nullptr;
    ZmLogLevel m_level = ZmLogNone;
    bool m_disabled = false;
};

/// Disables the write callback for the lifetime of the object.
class ZMLIB_API ZmLogFileScopedWriteCallbackDisabler {
public:
    ZmLogFileScopedWriteCallbackDisabler() { m_disabler.disableWriteCallback(); }
    ~ZmLogFileScopedWriteCallbackDisabler() { m_disabler.restoreWriteCallback(); }
    ZmLogFileScopedWriteCallbackDisabler(const ZmLogFileScopedWriteCallbackDisabler&) = delete;
    ZmLogFileScopedWriteCallbackDisabler& operator=(const ZmLogFileScopedWriteCallbackDisabler&) = delete;

private:
    ZmLogFileWriteCallbackDisabler m_disabler;
};
