// A scratch directory for one test, removed with everything in it (links are not followed).
#pragma once

#include <ftw.h>
#include <stdio.h>
#include <stdlib.h>

#include <fstream>
#include <iterator>
#include <string>

class ScratchDir {
public:
    ScratchDir()
    {
        const char* tmp = getenv("TMPDIR");
        std::string pattern = std::string(tmp != nullptr && tmp[0] != 0 ? tmp : "/tmp") + "/zmtest.XXXXXX";
        if (mkdtemp(pattern.data()) != nullptr) {
            m_path = pattern;
        }
    }
    ~ScratchDir() { removeTree(m_path); }
    ScratchDir(const ScratchDir&) = delete;
    ScratchDir& operator=(const ScratchDir&) = delete;

    /// The directory, without a trailing '/'; empty if it could not be made.
    const std::string& path() const { return m_path; }
    std::string operator/(const std::string& name) const { return m_path + "/" + name; }

    /// Writes \p text to the file \p rel below the directory (its folder must exist).
    void write(const std::string& rel, const std::string& text = "") const
    {
        std::ofstream(*this / rel) << text;
    }
    /// The whole content of the file \p rel below the directory ("" when it cannot be read).
    std::string read(const std::string& rel) const
    {
        std::ifstream in(*this / rel, std::ios::binary);
        return std::string(std::istreambuf_iterator<char>(in), {});
    }

    /// Removes \p path and everything below it, never following a symbolic link.
    static void removeTree(const std::string& path)
    {
        if (!path.empty()) {
            nftw(
                path.c_str(), [](const char* p, const struct stat*, int, struct FTW*) { return ::remove(p); },
                16, FTW_DEPTH | FTW_PHYS);
        }
    }

private:
    std::string m_path;
};
