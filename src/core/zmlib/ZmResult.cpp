#include <zmlib/ZmLogFile.h>
#include <zmlib/ZmResult.h>
#include <zmlib/ZmResult_p.h>
#include <zmlib/ZmThreadLocalStorageBase.h>

#include <cerrno>
#include <cstring>

namespace {

struct CodeText {
    int code;
    const char* text;
};

// The default data of a record, by code. Kept sorted by code for the binary search.
// The texts of the errno range are the ones callers have always shown, including the one at
// 4132, which does not describe that errno value: it is kept as it stands on purpose.
constexpr CodeText kDefaultTexts[] = {
    {0, "operation successful"},
    {2, "internal error"},
    {3, "data expected"},
    {4, "not supported"},
    {5, "read only"},
    {6, "out of range"},
    {7, "not implemented"},
    {8, "out of memory"},
    {9, "false"},
    {11, "operation interrupted"},
    {17, "one of the arguments is invalid"},
    {112, "Could not start Microsoft Word to create report document"},
    {113, "Error writing report document"},
    {120, "Could not save snapshot image!"},
    {1280,
     "OpenGL Error GL_INVALID_ENUM - An unacceptable value is specified for an enumerated argument. The "
     "offending function is ignored, having no side effect other than to set the error flag."},
    {1281, "OpenGL Error GL_INVALID_VALUE - A numeric argument is out of range. The offending function is "
           "ignored, having no side effect other than to set the error flag."},
    {1282, "OpenGL Error GL_INVALID_OPERATION - The specified operation is not allowed in the current state. "
           "The offending function is ignored, having no side effect other than to set the error flag."},
    {1283, "OpenGL Error GL_STACK_OVERFLOW - This function would cause a stack overflow. The offending "
           "function is ignored, having no side effect other than to set the error flag."},
    {1284, "OpenGL Error GL_STACK_UNDERFLOW - This function would cause a stack underflow. The offending "
           "function is ignored, having no side effect other than to set the error flag."},
    {1285,
     "OpenGL Error GL_OUT_OF_MEMORY - There is not enough memory left to execute the function. The state "
     "of OpenGL is undefined, except for the state of the error flags, after this error is recorded."},
    {4097, ""},
    {4098,
     "No such file or directory. The specified file or directory does not exist or cannot be found. This "
     "message can occur whenever a specified file does not exist or a component of a path does not "
     "specify an existing directory."},
    {4103, "Argument list too long."},
    {4104, "Exec format error. An attempt was made to execute a file that is not executable or that has an "
           "invalid executable-file format. "},
    {4105, "Bad file number. There are two possible causes: 1) The specified file descriptor is not a valid "
           "value or does not refer to an open file. 2) An attempt was made to write to a file or device "
           "opened for read-only access."},
    {4106, "No spawned processes."},
    {4107, "No more processes. An attempt to create a new process failed because there are no more process "
           "slots, or there is not enough memory, or the maximum nesting level has been reached."},
    {4108, "Not enough core. Not enough memory is available for the attempted operator. For example, this "
           "message can occur when insufficient memory is available to execute a child process, or when the "
           "allocation request in a _getcwd call cannot be satisfied."},
    {4109,
     "Permission denied. The file's permission setting does not allow the specified access. This error "
     "signifies that an attempt was made to access a file (or, in some cases, a directory) in a way that "
     "is incompatible with the file's attributes. For example, the error can occur when an attempt is "
     "made to read from a file that is not open, to open an existing read-only file for writing, or to "
     "open a directory instead of a file. Under MS-DOS operating system versions 3.0 and later, EACCES "
     "may also indicate a locking or sharing violation. The error can also occur in an attempt to rename "
     "a file or directory or to remove an existing directory."},
    {4112, "Resource busy."},
    {4113, "Files exist. An attempt has been made to create a file that already exists. For example, the "
           "_O_CREAT and _O_EXCL flags are specified in an _open call, but the named file already exists."},
    {4114, "Cross-device link. An attempt was made to move a file to a different device (using the rename "
           "function)."},
    {4118,
     "Invalid argument. An invalid value was given for one of the arguments to a function. For example, "
     "the value given for the origin when positioning a file pointer (by means of a call to fseek) is "
     "before the beginning of the file."},
    {4120, "Too many open files. No more file descriptors are available, so no more files can be opened."},
    {4124, "No space left on device. No more space for writing is available on the device (for example, when "
           "the disk is full)."},
    {4129, "Math argument."},
    {4130,
     "Result too large. An argument to a math function is too large, resulting in partial or total loss "
     "of significance in the result. This error can also occur in other functions when an argument is "
     "larger than expected (for example, when the buffer argument to _getcwd is longer than expected)."},
    {4132, "Resource deadlock would occur. The argument to a math function is not in the domain of the "
           "function."},
};

// The shorter table of Kv::kvError: its texts become the result's text, not its data.
const char* kvErrorText(int code)
{
    switch (code) {
    case 12:
        return "failed to write file";
    case 13:
        return "failed to read file";
    case 0:
    case 2:
    case 3:
    case 4:
    case 5:
    case 6:
    case 7:
    case 8:
    case 9:
    case 17:
        return ZmResult::defaultText(code);
    default:
        return nullptr;
    }
}

ZmDArray<ZmResult::NotificationCallback>& notificationList()
{
    // Never destroyed, so results may still notify during static destruction.
    static auto* const list = new ZmDArray<ZmResult::NotificationCallback>;
    return *list;
}

void deleteResult(void* p)
{
    delete static_cast<ZmResult*>(p);
}

ZmThreadLocalStorageBase& lastErrorSlot()
{
    // Never destroyed: threads may set errors while the process exits; each thread's result is
    // deleted when that thread ends.
    static auto* const slot = new ZmThreadLocalStorageBase(deleteResult);
    return *slot;
}

// The system's text for \p error with carriage returns and line feeds made blanks.
std::string systemText(int error)
{
    char buffer[256];
    std::string text = zmSystemErrorText(error, buffer, sizeof buffer);
    for (char& c : text) {
        if (c == '\r' || c == '\n') {
            c = ' ';
        }
    }
    return text;
}

const char* orEmpty(const char* s)
{
    return s == nullptr ? "" : s;
}

} // namespace

// --- the record --------------------------------------------------------------------------------

ZmResult::Error::Error(int code_, int line_, const char* file_, const char* text_, const char* data_)
    : code(code_), line(line_), file(file_), text(text_),
      data(data_ != nullptr && data_[0] != 0 ? data_ : defaultText(code_))
{
    getTheLogInstance().tracef(ZmLogDebug, "ZmResult::Error",
                               "code: %X file: %s line: %d message: %s data: %s", unsigned(code),
                               file.getString(), line, text.getString(), data.getString());
}

const char* ZmResult::defaultText(int code)
{
    int lo = 0;
    int hi = int(sizeof kDefaultTexts / sizeof kDefaultTexts[0]);
    while (lo < hi) {
        const int mid = (lo + hi) / 2;
        if (kDefaultTexts[mid].code < code) {
            lo = mid + 1;
        } else {
            hi = mid;
        }
    }
    const bool found =
        lo < int(sizeof kDefaultTexts / sizeof kDefaultTexts[0]) && kDefaultTexts[lo].code == code;
    return found ? kDefaultTexts[lo].text : "";
}

// --- the result --------------------------------------------------------------------------------

ZmResult::ZmResult(int code, int line, const char* file, const char* text, const char* data)
{
    if (code != 0) {
        m_error = new Error(code, line, file, text, data);
    }
}

ZmResult::ZmResult(Code code, int line, const char* file, const char* text, const char* data)
    : ZmResult(int(code), line, file, text, data)
{}

ZmResult::ZmResult(int code, const char* text, const char* data) : ZmResult(code, 0, nullptr, text, data)
{}

ZmResult::ZmResult(Code code, const char* text, const char* data)
    : ZmResult(int(code), 0, nullptr, text, data)
{}

ZmResult& ZmResult::makeBad(Code code)
{
    return makeBad(unsigned(code));
}

ZmResult& ZmResult::makeBad(unsigned int code)
{
    *this = ZmResult(int(code), nullptr, nullptr);
    return *this;
}

ZmResult& ZmResult::operator<<(const ZmResult& other)
{
    if (!m_error && other.m_error) {
        m_error = other.m_error;
    }
    return *this;
}

ZmResult& ZmResult::operator>>(ZmResult& target) const
{
    return target << *this;
}

ZmResult& ZmResult::throwOnFail()
{
    if (m_error) {
        throw ZmResult(*this);
    }
    return *this;
}

const ZmResult& ZmResult::notify() const
{
    if (!m_error) {
        return *this;
    }
    const ZmDArray<NotificationCallback>& list = notificationList();
    for (int64_t i = list.size() - 1; i >= 0; --i) {
        if (list[i](*this)) {
            break;
        }
    }
    return *this;
}

void ZmResult::notificationCallbackAdd(NotificationCallback fn)
{
    notificationList().append(fn);
}

void ZmResult::notificationCallbackRemove(NotificationCallback fn)
{
    ZmDArray<NotificationCallback>& list = notificationList();
    for (int64_t i = list.size() - 1; i >= 0; --i) {
        if (list[i] == fn) {
            list.remove(i, 1);
            return;
        }
    }
}

void ZmResult::notificationCallbackRemoveAll()
{
    notificationList().clear();
}

// --- Kv ----------------------------------------------------------------------------------------

ZmResult Kv::kvError(ZmResult::Code code, const char* file, unsigned int line, const char* function,
                     const char* date, const char* time, const char* data, bool withContext, bool setLast)
{
    ZmString context;
    if (withContext) {
        context.printf("%s%sin_function=%s\ndate=%s\ntime=%s", orEmpty(data), data != nullptr ? "\n" : "",
                       orEmpty(function), orEmpty(date), orEmpty(time));
        data = context.getString();
    }
    ZmResult result(code, int(line), file, kvErrorText(code), data);
    if (setLast) {
        setError(result);
    }
    return result;
}

bool Kv::fail(const ZmResult& r)
{
    if (r.ok()) {
        return false;
    }
    ZmString block;
    block.printf("\nFile: %s\nLine: %d\nCode: %X\nText: %s\nData: %s", r.file(), r.line(),
                 unsigned(r.codeValue()), r.text(), r.hasData() ? r.data() : "");
    getTheLogInstance().errorf("%s", block.getString());
    if (lastError(true).ok()) {
        setError(r);
    }
    r.notify();
    return true;
}

bool Kv::failWin(const ZmResult& r)
{
    const int error = errno;
    if (r.ok()) {
        return false;
    }
    const char* text = r.text();
    ZmString newText;
    newText.printf("%s%serror[%d %s]", text, text[0] != 0 ? " " : "", error, systemText(error).c_str());
    return fail(ZmResult(r.codeValue(), r.line(), r.file(), newText.getString(), r.data()));
}

bool Kv::logWinFunc(int64_t value, int64_t expected, const char* function, const char* message,
                    bool logSuccess)
{
    const int error = errno;
    if (value == expected) {
        if (logSuccess) {
            getTheLogInstance().printf("%s() %s", orEmpty(function), orEmpty(message));
        }
        return false;
    }
    getTheLogInstance().errorf("%s() %s [%lld <> %lld]: %s", orEmpty(function), orEmpty(message),
                               static_cast<long long>(value), static_cast<long long>(expected),
                               systemText(error).c_str());
    return true;
}

ZmResult Kv::lastError(bool keep)
{
    auto* stored = static_cast<ZmResult*>(lastErrorSlot().get());
    if (stored == nullptr) {
        return ZmResult();
    }
    ZmResult result = *stored;
    if (!keep) {
        stored->clear();
    }
    return result;
}

void Kv::setError(const ZmResult& r)
{
    ZmThreadLocalStorageBase& slot = lastErrorSlot();
    auto* stored = static_cast<ZmResult*>(slot.get());
    if (stored == nullptr) {
        slot.set(new ZmResult(r));
    } else {
        *stored = r;
    }
}

std::string Kv::winError()
{
    return systemText(errno);
}
