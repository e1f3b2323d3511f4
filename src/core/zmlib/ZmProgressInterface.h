/// \file
/// Nested progress reporting for long operations.
#pragma once

#include <zmlib/ZmExport.h>
#include <zmlib/ZmResult.h>

#include <cstdint>
#include <string>
#include <vector>

class ZmProgressGuiInterface;

/// Where a long operation reports how far it has come, and learns whether to stop.
///
/// Tasks nest: a task of n steps may open a sub-task of m steps inside one of its steps. The
/// progress is one overall value against one overall maximum, the product of the maxima of all
/// open tasks; with an outer task of 10 steps at step 3 and an inner task of 5 steps the maximum is
/// 50, the inner task starts at 15 and its step 2 is 17. When a sub-task stops, its outer task
/// moves on to the step after the one that held it. An attached display
/// (`ZmProgressGuiInterface`, not owned) receives the overall figures and may cancel.
///
/// Cancelling closes every open task; the canceled flag then stays set, and later
/// `startWorking`, `setProgressValue` and `nextStep` calls do nothing. A canceled run completes with
/// the result `ZmResult::Interrupted`, text "Operation canceled". Overflow of the overall figures
/// (products beyond the int range) is the caller's to avoid. Copies take every field, the display
/// pointer included, but the display stays attached to the original only. Whichever of an interface
/// and its display is destroyed first detaches the other. Not synchronised: one
/// thread drives an interface (a display's cancel request must reach it on that thread).
class ZMLIB_API ZmProgressInterface {
public:
    ZmProgressInterface() = default;
    ZmProgressInterface(const ZmProgressInterface& other);
    ZmProgressInterface& operator=(const ZmProgressInterface& other);
    virtual ~ZmProgressInterface();

    /// Detaches the current display (emptying its cancel callback) and attaches \p gui (may be
    /// null), whose cancel request then calls `cancel()`. A display attached to another interface
    /// leaves that one.
    virtual void setProgressGui(ZmProgressGuiInterface* gui);
    /// Opens a task of \p maximum steps (nothing when canceled or maximum < 1). An empty \p text
    /// inherits the text of the enclosing task.
    virtual void startWorking(int maximum, const std::string& text);
    /// Closes the innermost task.
    virtual void stopWorking();
    /// Step \p value of the innermost task (clamped to its maximum).
    virtual void setProgressValue(int value);
    /// When cancelling is allowed: sets the canceled flag and closes every task.
    virtual void cancel();
    virtual bool isCanceled() const;
    /// Logs "Operation failed: '<text>'" at error level, records a result of \p result's code with
    /// \p text, and closes every task.
    virtual void setFailed(const ZmResult& result, const char* text);

    bool isWorking() const noexcept { return m_working; }
    bool canCancel() const noexcept { return m_cancelAllowed; }
    /// Makes `cancel()` do nothing until the last task has stopped.
    void disableCancel() noexcept { m_cancelAllowed = false; }
    /// The innermost task's next step.
    void nextStep();
    /// Replaces the innermost task's text (shown by the display), without changing its figures.
    void setProgressInfo(const char* text);

protected:
    /// Called when the first task opens.
    virtual void beforeStartWorking();
    /// Called when the last task has stopped: completes the run with its result (a cancellation
    /// result when it was canceled without another failure) and allows cancelling again.
    virtual void afterStopWorking();
    virtual void setProgressValueGlobal(int value);
    /// The overall value.
    virtual int currentProgressValue() const;
    virtual void setMaximumGlobal(int maximum);
    virtual void setProgressText(const char* text);
    /// The innermost task's text, "" when none is open.
    virtual const char* progressText() const;
    virtual void setCompleted(const ZmResult& result);

private:
    friend class ProgressScope;
    friend class ZmProgressGuiInterface;

    struct Level {
        std::string text;
        int maximum;
    };

    int globalMaximum() const;
    /// Closes every open task.
    void terminate();

    ZmProgressGuiInterface* m_gui = nullptr;
    bool m_working = false;
    bool m_cancelAllowed = true;
    bool m_canceled = false;
    int m_value = 0;
    ZmResult m_result;
    std::vector<Level> m_levels;
    std::vector<int> m_offsets;
};

/// Closes, when it goes out of scope, every task opened on its interface since it was made, so a
/// block that opens tasks and leaves early (by return or exception) leaves none open.
class ZMLIB_API ProgressScope {
public:
    /// \p progress may be null.
    explicit ProgressScope(ZmProgressInterface* progress) noexcept;
    ProgressScope(const ProgressScope&) = delete;
    ProgressScope& operator=(const ProgressScope&) = delete;
    ~ProgressScope();

private:
    ZmProgressInterface* m_progress;
    uint64_t m_openTasks;
};
