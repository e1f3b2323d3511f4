/// \file
/// A long-lived worker thread that runs one job at a time.
#pragma once

#include <zmlib/ZmExport.h>
#include <zmlib/ZmString.h>

#include <cstdint>

class ZmWorkerThreadPrivate;

/// A thread that runs the derived class's `compute()` once per `start()`, and can be suspended,
/// cancelled and terminated between or during jobs.
///
/// The worker thread is started by the first `start()` and lives until `terminate()` (a later
/// `start()` launches it again); it calls `computeCtor()` before its first job and
/// `computeDtor()` after its last. A job cooperates by polling `suspended()` and `canceled()`.
/// The controlling side (`start`, `wait`, `suspend`, `resume`, `cancel`, `terminate`) is meant for
/// one controlling thread at a time; `state()`, `suspended()`, `canceled()` and `wakeCaller()` may
/// be called from any thread. A derived class should call `terminate()` in its own destructor, so
/// that `computeDtor()` still runs on the derived object. Owns its private thread. Nothing throws;
/// platform failures are written to the log by the underlying thread, mutex and conditions.
class ZMLIB_API ZmWorkerThread {
public:
    enum State : int32_t {
        Stopped = 0,            ///< worker loop not running (before start and after terminate)
        Idle = 1,               ///< waiting for a job
        Busy = 2,               ///< a job is requested or running
        Suspended = 3,          ///< the job is parked inside suspended()
        Canceled = 4,           ///< idle after a job that was cancelled
        SuspendRequested = 5,   ///< suspend() was called during a job
        CancelRequested = 6,    ///< cancel() was called during a job
        TerminateRequested = 7, ///< terminate() asked the loop to end
    };

    ZmWorkerThread(const ZmWorkerThread&) = delete;
    ZmWorkerThread& operator=(const ZmWorkerThread&) = delete;

    /// Requests a job; false when one is still in progress (the request is counted all the same).
    /// With \p synchronous, returns when the job has called `wakeCaller()` or has ended; in the
    /// latter case the worker is already idle, ready for the next `start()`.
    bool start(bool synchronous = false);
    /// Waits without limit for the current job; see `wait(bool&, unsigned long)`.
    bool wait();
    /// Waits for the current job to end, be suspended or be cancelled, each wait for a state change
    /// lasting up to \p ms milliseconds (4294967295 and more: no limit). False at once when there
    /// is nothing to wait for; on a time-out \p timedOut is set and the answer is true.
    bool wait(bool& timedOut, unsigned long ms);
    /// Asks the running job to park at its next `suspended()`. False when no job is running.
    bool suspend();
    /// Lets a parked job go on (true), or withdraws a pending suspension (false).
    bool resume();
    /// Resumes a suspended job, then asks the running job to stop. False when no job is running.
    bool cancel();
    /// For the job: parks here while suspended; true when it was.
    bool suspended();
    /// For the job: true when it has been asked to stop.
    bool canceled() const;
    /// Ends the worker thread after the current job (resuming a suspended one); not from the job.
    void terminate();
    /// For the job: releases the callers blocked in a synchronous `start()` before the job ends.
    void wakeCaller();
    State state() const;
    ZmString name() const;
    void setName(const char* name);
    /// Every `start()` call so far, successful or not.
    uint64_t jobsRequested() const;
    /// Every `compute()` that has returned so far.
    uint64_t jobsCompleted() const;

    /// Self-test: runs a counting job for a fifth of a second and logs its rate.
    static void test();

protected:
    explicit ZmWorkerThread(const char* name = "ZmWorkerThread");
    /// Terminates the worker thread (see the class comment) and deletes it.
    virtual ~ZmWorkerThread();
    /// On the worker thread, before its first job.
    virtual void computeCtor();
    /// The job, on the worker thread.
    virtual void compute() = 0;
    /// On the worker thread, after its last job.
    virtual void computeDtor();

private:
    friend class ZmWorkerThreadPrivate;
    ZmWorkerThreadPrivate* m_d;
};
