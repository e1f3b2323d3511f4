#include <zmlib/ZmProgressInterface.h>

#include <zmlib/ZmLogFile.h>
#include <zmlib/ZmProgressGuiInterface.h>

ZmProgressInterface::ZmProgressInterface(const ZmProgressInterface& other) = default;
ZmProgressInterface& ZmProgressInterface::operator=(const ZmProgressInterface& other) = default;

ZmProgressInterface::~ZmProgressInterface()
{
    // A display must not call back into an interface that is gone.
    if (m_gui != nullptr && m_gui->m_progress == this) {
        m_gui->m_cancelCallback = nullptr;
        m_gui->m_progress = nullptr;
    }
}

void ZmProgressInterface::setProgressGui(ZmProgressGuiInterface* gui)
{
    if (m_gui != nullptr) {
        m_gui->m_cancelCallback = nullptr;
        m_gui->m_progress = nullptr;
    }
    m_gui = gui;
    if (gui != nullptr) {
        // A display serves one interface at a time: the one it leaves forgets it.
        if (gui->m_progress != nullptr && gui->m_progress != this) {
            gui->m_progress->m_gui = nullptr;
        }
        gui->m_cancelCallback = [this] { cancel(); };
        gui->m_progress = this;
    }
}

int ZmProgressInterface::globalMaximum() const
{
    int product = 1;
    for (const Level& level : m_levels) {
        product *= level.maximum;
    }
    return product;
}

void ZmProgressInterface::startWorking(int maximum, const std::string& text)
{
    if (m_canceled || maximum < 1) {
        return;
    }
    if (m_levels.empty()) {
        // A new run: the previous one left its final value behind.
        m_value = 0;
        m_working = true;
        beforeStartWorking();
    }
    const std::string taskText = text.empty() && !m_levels.empty() ? m_levels.back().text : text;
    m_levels.push_back(Level{taskText, maximum});
    m_value *= maximum;
    m_offsets.push_back(m_value);
    setMaximumGlobal(globalMaximum());
    setProgressText(taskText.c_str());
    setProgressValue(0);
}

void ZmProgressInterface::setProgressValue(int value)
{
    if (m_canceled || m_levels.empty()) {
        return;
    }
    const int maximum = m_levels.back().maximum;
    m_value = (value < maximum ? value : maximum) + m_offsets.back();
    setProgressValueGlobal(m_value);
}

void ZmProgressInterface::nextStep()
{
    if (m_canceled || m_levels.empty()) {
        return;
    }
    setProgressValue(m_value - m_offsets.back() + 1);
}

void ZmProgressInterface::stopWorking()
{
    if (m_levels.empty()) {
        if (m_working) {
            m_working = false;
            afterStopWorking();
        }
        return;
    }
    if (m_levels.size() > 1) {
        // The outer task moves to the step after the one that held the sub-task.
        m_value = m_offsets.back() / m_levels.back().maximum + 1;
        m_levels.pop_back();
        setProgressText(m_levels.back().text.c_str());
        setMaximumGlobal(globalMaximum());
        setProgressValueGlobal(m_value);
        m_offsets.pop_back();
        return;
    }
    m_working = false;
    m_value = m_levels.back().maximum;
    m_levels.pop_back();
    afterStopWorking();
    m_offsets.pop_back();
}

void ZmProgressInterface::terminate()
{
    while (!m_levels.empty()) {
        stopWorking();
    }
}

void ZmProgressInterface::cancel()
{
    if (!m_cancelAllowed) {
        return;
    }
    m_canceled = true;
    terminate();
}

bool ZmProgressInterface::isCanceled() const
{
    return m_canceled;
}

void ZmProgressInterface::setFailed(const ZmResult& result, const char* text)
{
    const char* t = text != nullptr ? text : "";
    getTheLogInstance().errorf("Operation failed: '%s'\n", t);
    m_result = ZmResult(result.codeValue(), t, "");
    terminate();
}

void ZmProgressInterface::setProgressInfo(const char* text)
{
    setProgressText(text);
}

void ZmProgressInterface::beforeStartWorking()
{}

void ZmProgressInterface::afterStopWorking()
{
    if (m_result.ok() && m_canceled) {
        m_result = ZmResult(ZmResult::Interrupted, "Operation canceled", "");
    }
    setCompleted(m_result);
    m_cancelAllowed = true;
}

void ZmProgressInterface::setProgressValueGlobal(int value)
{
    if (m_gui != nullptr) {
        m_gui->setValue(value);
    }
}

int ZmProgressInterface::currentProgressValue() const
{
    return m_value;
}

void ZmProgressInterface::setMaximumGlobal(int maximum)
{
    if (m_gui != nullptr) {
        m_gui->setMaximum(maximum);
    }
}

void ZmProgressInterface::setProgressText(const char* text)
{
    const char* t = text != nullptr ? text : "";
    if (!m_levels.empty()) {
        m_levels.back().text = t;
    }
    if (m_gui != nullptr) {
        m_gui->showText(t);
    }
}

const char* ZmProgressInterface::progressText() const
{
    return m_levels.empty() ? "" : m_levels.back().text.c_str();
}

void ZmProgressInterface::setCompleted(const ZmResult& result)
{
    if (m_gui != nullptr) {
        m_gui->setCompleted(result);
    }
}

ProgressScope::ProgressScope(ZmProgressInterface* progress) noexcept
    : m_progress(progress), m_openTasks(progress != nullptr ? progress->m_levels.size() : 0)
{}

ProgressScope::~ProgressScope()
{
    while (m_progress != nullptr && m_progress->m_levels.size() > m_openTasks) {
        m_progress->stopWorking();
    }
}
