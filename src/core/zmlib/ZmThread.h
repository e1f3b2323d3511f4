/// \file
/// A thread with a virtual body, and the identity of processes and threads.
#pragma once

#include <zmlib/ZmExport.h>
#include <zmlib/ZmString.h>

struct ZmThreadPrivate;

/// A detached POSIX thread that runs the derived class's `run()`.
///
/// The object is reusable: once a run has finished, `start()` runs the body again. Copies share
/// the thread (a copy and its source are the same thread); the last of them releases it. The
/// destructor neither stops nor joins the thread, so the object that is running must outlive its
/// body. `start()`, `wait()`, `running()` and `finished()` may be called from any thread; the name
/// belongs to one thread at a time. A failed thread creation is written to the log as a warning
/// and leaves the state as it was; nothing throws.
class ZMLIB_API ZmThread {
public:
    /// Named "ZmThread <n>", n counting every thread object the process has constructed.
    ZmThread();
    /// Named \p name (null: as the default constructor); counts in the numbering all the same.
    explicit ZmThread(const char* name);
    ZmThread(const ZmThread& other);
    ZmThread& operator=(const ZmThread& other);
    virtual ~ZmThread();

    /// Runs `run()` on a new thread; first waits for a run that is still going to finish.
    void start();
    /// Waits up to \p ms milliseconds (4294967295 and more: no limit) for the running body to
    /// return. True when it did, or when nothing is running; false on time-out.
    bool wait(unsigned long ms = 4294967295UL);
    bool running() const;
    bool finished() const;
    ZmString threadName() const;
    void setThreadName(const char* name);

    static void sleep(unsigned long seconds);
    static void msleep(unsigned long ms);
    /// Sleeps \p us / 1000 + 1 milliseconds (never zero).
    static void usleep(unsigned long us);
    /// Gives up the rest of the time slice.
    static void yield();
    /// Does nothing: native thread names are not set.
    static void setThreadNameNative(const char* name);

protected:
    /// The body, on the new thread.
    virtual void run() = 0;

private:
    static void* trampoline(void* d);

    ZmThreadPrivate* m_d;
};

/// The operating system's process id.
ZMLIB_API unsigned long kvCurrentProcessId();
/// The operating system's id of the calling thread.
ZMLIB_API unsigned long kvCurrentThreadId();
/// The id of the main thread: the first thread that called this or `kvIsMainThread()`.
ZMLIB_API unsigned long kvMainThreadId();
/// True on the main thread (see `kvMainThreadId()`).
ZMLIB_API bool kvIsMainThread();
