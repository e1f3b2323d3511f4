// zmtool md5 / cksum against the system's md5sum and cksum on the same files: the outputs must be
// byte-identical and the exit statuses equal.
#include "RunProgram.h"
#include "ScratchDir.h"

#include <gtest/gtest.h>

#include <fcntl.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <random>
#include <sstream>
#include <string>
#include <vector>

namespace {

class ZmtoolFingerprint : public ZmtoolTest {
protected:
    void SetUp() override
    {
        ZmtoolTest::SetUp();
        if (IsSkipped() || HasFatalFailure()) {
            return;
        }
        for (const char* program : {"md5sum", "cksum"}) {
            if (runProgram(m_dir, {program, "--version"}).status != 0) {
                GTEST_SKIP() << program << " is not available as an oracle";
            }
        }
    }

    std::string makeFile(const std::string& name, size_t size)
    {
        std::vector<char> bytes(size);
        for (char& b : bytes) {
            b = static_cast<char>(m_rng());
        }
        const std::string path = m_dir / name;
        std::ofstream(path, std::ios::binary).write(bytes.data(), std::streamsize(size));
        return path;
    }

    // Runs "zmtool <command> args" and "<oracle> args" and compares stdout and exit status.
    Outcome compare(const char* command, const char* oracle, const std::vector<std::string>& args,
                    const std::string& input = "")
    {
        std::vector<std::string> ours = {m_tool, command};
        std::vector<std::string> theirs = {oracle};
        ours.insert(ours.end(), args.begin(), args.end());
        theirs.insert(theirs.end(), args.begin(), args.end());
        const Outcome a = runProgram(m_dir, ours, {input});
        const Outcome b = runProgram(m_dir, theirs, {input});
        EXPECT_EQ(a.out, b.out) << command << " vs " << oracle;
        EXPECT_EQ(a.status, b.status) << command << " vs " << oracle << "; our stderr: " << a.err;
        return a;
    }

    std::mt19937 m_rng{2024};
};

} // namespace

TEST_F(ZmtoolFingerprint, OutputMatchesMd5sumAndCksumForManySizesAndNames)
{
    std::vector<std::string> files;
    for (const size_t size :
         {size_t(0), size_t(1), size_t(63), size_t(64), size_t(65), (size_t(1) << 20) + 7}) {
        files.push_back(makeFile("size" + std::to_string(size), size));
    }
    files.push_back(makeFile("with blank", 100));
    // md5sum escapes these three characters; cksum prints names as they are.
    files.push_back(makeFile("back\\slash\nnew line\rreturn", 10));
    for (const auto& [command, oracle] : {std::pair{"md5", "md5sum"}, std::pair{"cksum", "cksum"}}) {
        const Outcome r = compare(command, oracle, files);
        EXPECT_EQ(r.status, 0);
        EXPECT_EQ(r.err, "");
        // One line per file, except that cksum also prints the line feed inside the last name.
        const long lines = long(files.size()) + (std::string(command) == "cksum" ? 1 : 0);
        EXPECT_EQ(std::count(r.out.begin(), r.out.end(), '\n'), lines);
    }
}

TEST_F(ZmtoolFingerprint, StandardInputWithAndWithoutDash)
{
    const std::string input = makeFile("input", 5000);
    for (const auto& [command, oracle] : {std::pair{"md5", "md5sum"}, std::pair{"cksum", "cksum"}}) {
        compare(command, oracle, {}, input);         // no name for cksum, "-" for md5sum
        compare(command, oracle, {"-"}, input);      // "-" for both
        compare(command, oracle, {"-", "-"}, input); // the second read finds the input used up
    }
}

TEST_F(ZmtoolFingerprint, UnreadableFilesAreReportedAndTheOthersStillDone)
{
    const std::string good = makeFile("good", 300);
    const std::string missing = m_dir / "missing";
    const std::string later = makeFile("later", 3);
    for (const auto& [command, oracle] : {std::pair{"md5", "md5sum"}, std::pair{"cksum", "cksum"}}) {
        const Outcome r = compare(command, oracle, {good, missing, later});
        EXPECT_NE(r.status, 0);
        EXPECT_EQ(r.err, std::string("zmtool ") + command + ": " + missing + ": No such file or directory\n");
    }
    // A directory: md5sum fails on it as well (cksum of this coreutils version prints a checksum
    // of nothing, which zmtool deliberately does not copy).
    const Outcome md5 = compare("md5", "md5sum", {m_dir.path(), good});
    EXPECT_EQ(md5.err, "zmtool md5: " + m_dir.path() + ": Is a directory\n");
    const Outcome crc = runProgram(m_dir, {m_tool, "cksum", m_dir.path(), good});
    EXPECT_EQ(crc.status, 1);
    EXPECT_EQ(crc.err, "zmtool cksum: " + m_dir.path() + ": Is a directory\n");
    EXPECT_EQ(crc.out, runProgram(m_dir, {"cksum", good}).out);
}

TEST_F(ZmtoolFingerprint, UnknownOptionIsAUsageError)
{
    const Outcome r = runProgram(m_dir, {m_tool, "md5", "-q"});
    EXPECT_EQ(r.status, 2);
    EXPECT_EQ(r.out, "");
    EXPECT_NE(r.err.find("zmtool md5: unknown option '-q'"), std::string::npos) << r.err;
    // After "--" a leading dash is part of a name.
    const std::string odd = makeFile("-q", 9);
    ASSERT_EQ(odd, m_dir / "-q");
    compare("md5", "md5sum", {"--", "-q"});
}
