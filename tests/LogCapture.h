// Captures what the process log hands to its write callback, for tests that check log lines.
#pragma once

#include <zmlib/ZmLogFile.h>

#include <string>
#include <vector>

/// Installs a write callback at \p level (and lowers the log level to it) for its lifetime, and
/// restores the previous settings afterwards. One at a time.
class LogCapture {
public:
    explicit LogCapture(ZmLogLevel level = ZmLogDebug)
        : m_oldLevel(getTheLogInstance().logLevel()), m_oldCallback(getTheLogInstance().writeCallback()),
          m_oldCallbackLevel(getTheLogInstance().writeCallbackLogLevel())
    {
        lines().clear();
        getTheLogInstance().setLogLevel(level);
        getTheLogInstance().setWriteCallback(&LogCapture::collect, level);
    }
    ~LogCapture()
    {
        getTheLogInstance().setWriteCallback(m_oldCallback, m_oldCallbackLevel);
        getTheLogInstance().setLogLevel(m_oldLevel);
    }
    LogCapture(const LogCapture&) = delete;
    LogCapture& operator=(const LogCapture&) = delete;

    /// Each line with its level, as "<level digit>|<line>".
    static std::vector<std::string>& lines()
    {
        static std::vector<std::string> captured;
        return captured;
    }
    /// The lines containing \p text.
    static std::vector<std::string> matching(const std::string& text)
    {
        std::vector<std::string> out;
        for (const std::string& line : lines()) {
            if (line.find(text) != std::string::npos) {
                out.push_back(line);
            }
        }
        return out;
    }

private:
    static void collect(ZmLogLevel level, const ZmString& line)
    {
        lines().push_back(std::to_string(int(level)) + "|" + line.getString());
    }

    ZmLogLevel m_oldLevel;
    ZmLogFile::WriteCallback m_oldCallback;
    ZmLogLevel m_oldCallbackLevel;
};
