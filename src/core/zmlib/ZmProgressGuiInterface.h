/// \file
/// The display side of progress reporting.
#pragma once

#include <zmlib/ZmExport.h>

#include <functional>
#include <string>

class ZmProgressInterface;
class ZmResult;

/// A progress display (a bar, a dialog, a terminal line) attached to a `ZmProgressInterface`.
///
/// It sees only the overall figures: one maximum, one value, the innermost task's text and the
/// final result. A display whose user asks to stop calls `callCancelCallback()`, which cancels the
/// attached interface. The interface attaches and detaches itself (`setProgressGui`); the display
/// owns nothing of it. Called on the thread that does the work; not synchronised.
class ZMLIB_API ZmProgressGuiInterface {
public:
    ZmProgressGuiInterface() = default;
    ZmProgressGuiInterface(const ZmProgressGuiInterface&) = delete;
    ZmProgressGuiInterface& operator=(const ZmProgressGuiInterface&) = delete;
    virtual ~ZmProgressGuiInterface();

    /// The innermost task's text.
    virtual void showText(const std::string& text) = 0;
    /// The overall maximum: the product of the maxima of the open tasks.
    virtual void setMaximum(int maximum) = 0;
    /// The overall value, 0 to the overall maximum.
    virtual void setValue(int value) = 0;
    /// The outcome of the run, once its last task has stopped.
    virtual void setCompleted(const ZmResult& result) = 0;
    virtual void setWindowTitle(const std::string& title);
    virtual void show();

    /// The interface this display is attached to, or null.
    ZmProgressInterface* progressInterface() const noexcept { return m_progress; }

protected:
    void setCancelCallback(std::function<void()> callback);
    /// Asks the attached interface to cancel (nothing when no callback is set).
    void callCancelCallback();

private:
    friend class ZmProgressInterface;

    ZmProgressInterface* m_progress = nullptr;
    std::function<void()> m_cancelCallback;
};
