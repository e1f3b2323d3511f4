/// \file
/// Results of fallible operations, and the `Kv` helpers that build, keep and log them.
#pragma once

#include <zmlib/ZmExport.h>
#include <zmlib/ZmHandable.h>
#include <zmlib/ZmHandle.h>
#include <zmlib/ZmString.h>

#include <cstdint>
#include <string>

/// The outcome of an operation: null for success, else a shared reference to an error record.
///
/// A result is one pointer wide and cheap to return. Copies share the record; the record goes
/// with its last reference. Results combine with `operator<<` so that the first failure is kept.
/// Creating a record writes a debug-level trace line to the process log. Nothing here throws
/// except `throwOnFail()` (and allocation failure).
///
/// The record's count is not atomic: a result may be handed to another thread, but copies of one
/// record must not be made or dropped by two threads at once.
///
/// `[[nodiscard]]`: a function returning a result by value reports a failure nobody may ignore
/// silently; a caller that means to ignore one says so with a `(void)` cast.
class ZMLIB_NODISCARD_API ZmResult {
public:
    /// The library's codes; 1280-1285 are graphics-library errors, `ErrnoBase` + n is errno n.
    /// Other numbers may be used; they have no default text.
    enum Code : int {
        Success = 0,
        InternalError = 2,
        DataExpected = 3,
        NotSupported = 4,
        ReadOnly = 5,
        OutOfRange = 6,
        NotImplemented = 7,
        OutOfMemory = 8,
        False = 9,
        Interrupted = 11,
        WriteFileFailed = 12,
        ReadFileFailed = 13,
        InvalidArgument = 17,
        ReportStartFailed = 112,
        ReportWriteFailed = 113,
        SnapshotSaveFailed = 120,
        GlInvalidEnum = 1280,
        GlInvalidValue = 1281,
        GlInvalidOperation = 1282,
        GlStackOverflow = 1283,
        GlStackUnderflow = 1284,
        GlOutOfMemory = 1285,
        ErrnoBase = 4096
    };

    /// The shared error record.
    class ZMLIB_API Error : public ZmHandable {
    public:
        /// \p data null or empty takes the default text of \p code (empty when it has none).
        Error(int code, int line, const char* file, const char* text, const char* data);

        int code;
        int line;
        ZmString file;
        ZmString text;
        ZmString data;
    };

    using NotificationCallback = bool (*)(const ZmResult& result);

    /// Success.
    ZmResult() noexcept = default;
    /// Code 0 gives success and no record, whatever the other arguments.
    ZmResult(int code, int line, const char* file, const char* text, const char* data);
    ZmResult(Code code, int line, const char* file, const char* text, const char* data);
    ZmResult(int code, const char* text, const char* data);
    ZmResult(Code code, const char* text = nullptr, const char* data = nullptr);

    bool ok() const noexcept { return !m_error; }
    bool isOk() const noexcept { return !m_error; }
    explicit operator bool() const noexcept { return !m_error; }
    bool isBad() const noexcept { return bool(m_error); }
    bool failed() const noexcept { return bool(m_error); }

    /// 0 on success.
    Code code() const noexcept { return Code(codeValue()); }
    int codeValue() const noexcept { return m_error ? m_error->code : 0; }
    int line() const noexcept { return m_error ? m_error->line : 0; }
    /// Never null: "" on success.
    const char* file() const noexcept { return m_error ? m_error->file.getString() : ""; }
    const char* text() const noexcept { return m_error ? m_error->text.getString() : ""; }
    const char* data() const noexcept { return m_error ? m_error->data.getString() : ""; }
    bool hasData() const noexcept { return m_error && m_error->data.length() != 0; }
    /// The record, null on success.
    const Error* error() const noexcept { return m_error.get(); }

    /// A new result of \p code with empty text, so the data takes the code's default text;
    /// 0 makes this a success.
    ZmResult& makeBad(Code code);
    ZmResult& makeBad(unsigned int code);
    /// Success.
    void clear() { m_error.reset(); }

    /// Keeps the first failure: takes \p other's record only when this is ok and other is not.
    ZmResult& operator<<(const ZmResult& other);
    /// `target << *this`; returns target.
    ZmResult& operator>>(ZmResult& target) const;

    /// On failure throws a copy of this result (sharing the record); else returns this.
    ZmResult& throwOnFail();
    /// On failure calls the notification callbacks, newest first, until one returns true.
    const ZmResult& notify() const;

    /// The callback list is process-wide and unguarded: register during start-up.
    static void notificationCallbackAdd(NotificationCallback fn);
    /// Removes the most recently added occurrence of \p fn, if any.
    static void notificationCallbackRemove(NotificationCallback fn);
    static void notificationCallbackRemoveAll();

    /// The default text of a code (the data of a record given none); "" when it has none.
    static const char* defaultText(int code);

private:
    ZmHandle<Error> m_error;
};

/// Helpers that build results with context, keep the last error of each thread, turn the
/// system's last error into results and write failures to the process log.
namespace Kv {

/// A result of \p code whose text is the code's short text (for 0, 2-9, 12, 13, 17; none
/// otherwise). With \p withContext the data becomes "<data>\nin_function=..\ndate=..\ntime=..";
/// with \p setLast the result also becomes this thread's last error.
ZMLIB_API ZmResult kvError(ZmResult::Code code, const char* file, unsigned int line, const char* function,
                           const char* date, const char* time, const char* data, bool withContext,
                           bool setLast);
/// Logs a failure at error level as "\nFile: ..\nLine: ..\nCode: ..\nText: ..\nData: ..", makes it
/// this thread's last error unless there is one, notifies, and returns true; false for a success.
ZMLIB_API bool fail(const ZmResult& r);
/// `fail` with " error[<errno> <strerror>]" added to the text; false for a success.
ZMLIB_API bool failWin(const ZmResult& r);
/// For \p value == \p expected logs "function() message" as a plain line when \p logSuccess and
/// returns false; otherwise logs the mismatch and the system's last error and returns true.
ZMLIB_API bool logWinFunc(int64_t value, int64_t expected, const char* function, const char* message,
                          bool logSuccess);
/// This thread's last error (success if none); cleared unless \p keep.
ZMLIB_API ZmResult lastError(bool keep = false);
/// Stores \p r as this thread's last error.
ZMLIB_API void setError(const ZmResult& r);
/// The system's text for the current errno.
ZMLIB_API std::string winError();

} // namespace Kv

/// A result of \p code with the caller's file, line, function, date and time in its data, also
/// stored as the thread's last error.
#define KV_ERROR(code, data)                                                                                 \
    Kv::kvError((code), __FILE__, __LINE__, __func__, __DATE__, __TIME__, (data), true, true)
