// A one-line progress display on standard error: a bar, the percentage, the rate and the time
// left. It draws only when standard error is a terminal and only for work that has already run
// for half a second, so that quick commands and redirected output stay clean.
#pragma once

#include <zmlib/ZmProgressGuiInterface.h>

#include <chrono>
#include <csignal>
#include <cstdint>
#include <string>

namespace zmtool {

class TerminalProgress : public ZmProgressGuiInterface {
public:
    TerminalProgress();
    ~TerminalProgress() override;

    /// Direct use, without a progress interface: a new task of \p total units, each standing for
    /// \p bytesPerUnit bytes (0: no rate is shown).
    void begin(const std::string& label, uint64_t total, double bytesPerUnit);
    void update(uint64_t done);
    /// Wipes the line (the next message then starts on a clean line).
    void clear();

    /// The bytes the next task of the attached interface stands for, for the rate.
    void setTaskBytes(uint64_t bytes) { m_taskBytes = bytes; }
    /// A flag set by a signal handler: while it is set, each progress step cancels the attached
    /// interface.
    void watchInterrupt(const volatile std::sig_atomic_t* flag) { m_interrupt = flag; }

    void showText(const std::string& text) override;
    void setMaximum(int maximum) override;
    void setValue(int value) override;
    void setCompleted(const ZmResult& result) override;

private:
    void draw(uint64_t done);

    using Clock = std::chrono::steady_clock;
    bool m_enabled;
    std::string m_label;
    uint64_t m_total = 0;
    double m_bytesPerUnit = 0;
    uint64_t m_taskBytes = 0;
    Clock::time_point m_start;
    Clock::time_point m_lastDraw;
    int m_width = 0; // columns to wipe; 0 while nothing is shown
    const volatile std::sig_atomic_t* m_interrupt = nullptr;
};

} // namespace zmtool
