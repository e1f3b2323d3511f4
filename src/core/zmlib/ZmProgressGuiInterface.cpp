#include <zmlib/ZmProgressGuiInterface.h>

#include <zmlib/ZmProgressInterface.h>

ZmProgressGuiInterface::~ZmProgressGuiInterface()
{
    // The interface must not report to a display that is gone.
    if (m_progress != nullptr && m_progress->m_gui == this) {
        m_progress->m_gui = nullptr;
    }
}

void ZmProgressGuiInterface::setWindowTitle(const std::string&)
{}

void ZmProgressGuiInterface::show()
{}

void ZmProgressGuiInterface::setCancelCallback(std::function<void()> callback)
{
    m_cancelCallback = std::move(callback);
}

void ZmProgressGuiInterface::callCancelCallback()
{
    if (m_cancelCallback) {
        m_cancelCallback();
    }
}
