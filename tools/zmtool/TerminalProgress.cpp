#include "TerminalProgress.h"

#include <sys/ioctl.h>
#include <unistd.h>

#include <cstdio>
#include <cstring>

namespace zmtool {

namespace {

const std::chrono::milliseconds kQuietStart(500);
const std::chrono::milliseconds kRedrawEvery(100);

// "1:05", "1:02:05".
std::string clockText(double seconds)
{
    const long s = seconds < 0 ? 0 : long(seconds + 0.5);
    char text[32];
    if (s >= 3600) {
        std::snprintf(text, sizeof text, "%ld:%02ld:%02ld", s / 3600, s / 60 % 60, s % 60);
    } else {
        std::snprintf(text, sizeof text, "%ld:%02ld", s / 60, s % 60);
    }
    return text;
}

} // namespace

TerminalProgress::TerminalProgress() : m_enabled(isatty(2) != 0), m_start(Clock::now())
{}

TerminalProgress::~TerminalProgress()
{
    clear();
}

void TerminalProgress::begin(const std::string& label, uint64_t total, double bytesPerUnit)
{
    m_label = label;
    m_total = total;
    m_bytesPerUnit = bytesPerUnit;
    m_start = Clock::now();
}

void TerminalProgress::update(uint64_t done)
{
    if (m_enabled) {
        const Clock::time_point t = Clock::now();
        if (t - m_start >= kQuietStart && (m_width == 0 || t - m_lastDraw >= kRedrawEvery)) {
            m_lastDraw = t;
            draw(done);
        }
    }
}

void TerminalProgress::clear()
{
    if (m_width > 0) {
        std::fprintf(stderr, "\r%*s\r", m_width, "");
        std::fflush(stderr);
        m_width = 0;
    }
}

void TerminalProgress::showText(const std::string& text)
{
    m_label = text;
}

void TerminalProgress::setMaximum(int maximum)
{
    // A new top-level task starts its clock; a nested one only refines the same run.
    if (m_total == 0) {
        m_start = Clock::now();
    }
    m_total = maximum > 0 ? uint64_t(maximum) : 0;
    m_bytesPerUnit = m_total > 0 ? double(m_taskBytes) / double(m_total) : 0;
}

void TerminalProgress::setValue(int value)
{
    if (m_interrupt != nullptr && *m_interrupt != 0) {
        callCancelCallback();
        return;
    }
    update(value > 0 ? uint64_t(value) : 0);
}

void TerminalProgress::setCompleted(const ZmResult&)
{
    clear();
    m_total = 0;
}

void TerminalProgress::draw(uint64_t done)
{
    int columns = 80;
    winsize ws{};
    if (ioctl(2, TIOCGWINSZ, &ws) == 0 && ws.ws_col > 0) {
        columns = ws.ws_col;
    }
    // Stay one column short of the edge so that the terminal never wraps the line.
    const int room = columns - 1;
    const double elapsed = std::chrono::duration<double>(Clock::now() - m_start).count();
    const uint64_t shown = m_total > 0 && done > m_total ? m_total : done;
    std::string tail;
    char part[64];
    int barWidth = 0;
    if (m_total > 0) {
        std::snprintf(part, sizeof part, "%3d%%", int(shown * 100 / m_total));
        tail = part;
        barWidth = room >= 60 ? 30 : room / 4;
    } else if (m_bytesPerUnit > 0) {
        std::snprintf(part, sizeof part, "%.0f MiB", double(done) * m_bytesPerUnit / 1048576.0);
        tail = part;
    }
    if (m_bytesPerUnit > 0 && elapsed > 0) {
        std::snprintf(part, sizeof part, "  %.0f MiB/s",
                      double(shown) * m_bytesPerUnit / elapsed / 1048576.0);
        tail += part;
    }
    if (m_total > 0 && shown > 0 && shown < m_total) {
        tail += "  " + clockText(elapsed * double(m_total - shown) / double(shown)) + " left";
    }
    std::string line = m_label;
    const int fixed = (barWidth > 0 ? barWidth + 3 : 1) + int(tail.size());
    const int labelRoom = room - fixed;
    if (labelRoom < 4) {
        line.clear();
    } else if (int(line.size()) > labelRoom) {
        line = "..." + line.substr(line.size() - size_t(labelRoom - 3));
    }
    if (barWidth > 0) {
        const int filled = int(shown * uint64_t(barWidth) / m_total);
        line += " [";
        line.append(size_t(filled), '#');
        line.append(size_t(barWidth - filled), '.');
        line += "] ";
    } else {
        line += " ";
    }
    line += tail;
    if (int(line.size()) > room) {
        line.resize(size_t(room > 0 ? room : 0));
    }
    const int width = int(line.size());
    // Pad over whatever a longer previous line left behind.
    std::fprintf(stderr, "\r%s%*s", line.c_str(), m_width > width ? m_width - width : 0, "");
    std::fflush(stderr);
    if (width > m_width) {
        m_width = width;
    }
}

} // namespace zmtool
