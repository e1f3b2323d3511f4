// zmtool raw as a user runs it: digests against md5sum, values against a re-computation in the
// test, refusals, in-place replacement and Ctrl-C. The value transforms are checked against NumPy
// on real images in zmtool_raw_pydicom.py.
#include "../RunProgram.h"
#include "../ScratchDir.h"

#include <gtest/gtest.h>

#include <dirent.h>

#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <random>
#include <string>
#include <vector>

namespace {

class ZmtoolRaw : public ZmtoolTest {
protected:
    void SetUp() override
    {
        ZmtoolTest::SetUp();
        if (IsSkipped() || HasFatalFailure()) {
            return;
        }
        // 7 x 5 x 3 shorts.
        std::mt19937 rng(7);
        m_values.resize(105);
        for (int16_t& v : m_values) {
            v = int16_t(int(rng() % 5000) - 1500);
        }
        write("v.raw", m_values);
    }

    void write(const std::string& name, const std::vector<int16_t>& values)
    {
        std::ofstream(m_dir / name, std::ios::binary)
            .write(reinterpret_cast<const char*>(values.data()), std::streamsize(values.size() * 2));
    }

    Outcome raw(Args args, RunOptions options = {})
    {
        args.insert(args.begin(), {m_tool, "raw"});
        return runProgram(m_dir, args, options);
    }

    // The names in the scratch directory other than the captured output.
    std::vector<std::string> listing() const
    {
        std::vector<std::string> names;
        DIR* d = opendir(m_dir.path().c_str());
        while (dirent* e = d != nullptr ? readdir(d) : nullptr) {
            const std::string n = e->d_name;
            if (n != "." && n != ".." && n != ".stdout" && n != ".stderr") {
                names.push_back(n);
            }
        }
        if (d != nullptr) {
            closedir(d);
        }
        std::sort(names.begin(), names.end());
        return names;
    }

    std::vector<int16_t> m_values;
};

const Args kShape = {"--dims", "7,5,3", "--type", "short"};

Args operator+(Args a, const Args& b)
{
    a.insert(a.end(), b.begin(), b.end());
    return a;
}

} // namespace

TEST_F(ZmtoolRaw, InfoAgreesWithMd5sumAndARecomputedRangeInBothByteOrders)
{
    const Outcome info = raw(Args{"info", "v.raw"} + kShape);
    ASSERT_EQ(info.status, 0) << info.err;
    const Outcome md5 = runProgram(m_dir, {"md5sum", "v.raw"});
    ASSERT_EQ(md5.status, 0);
    EXPECT_NE(info.out.find("md5:        " + md5.out.substr(0, 32) + "\n"), std::string::npos) << info.out;
    const auto range = std::minmax_element(m_values.begin(), m_values.end());
    const std::string rangeLine =
        "range:      " + std::to_string(*range.first) + " .. " + std::to_string(*range.second);
    EXPECT_NE(info.out.find(rangeLine + "\n"), std::string::npos) << info.out;
    EXPECT_NE(info.out.find("constant:   no\n"), std::string::npos);

    // Swapped bytes read back as big-endian give the same values; swapped twice, the same file.
    ASSERT_EQ(raw(Args{"swap-bytes", "v.raw", "-o", "s.raw"} + kShape).status, 0);
    const Outcome be = raw(Args{"info", "s.raw", "--big-endian"} + kShape);
    EXPECT_NE(be.out.find(rangeLine + "\n"), std::string::npos) << be.out;
    ASSERT_EQ(raw(Args{"swap-bytes", "s.raw", "--in-place", "--big-endian"} + kShape).status, 0);
    EXPECT_EQ(m_dir.read("s.raw"), m_dir.read("v.raw"));

    write("c.raw", std::vector<int16_t>(105, -3));
    EXPECT_NE(raw(Args{"info", "c.raw"} + kShape).out.find("constant:   yes\n"), std::string::npos);
}

TEST_F(ZmtoolRaw, RefusalsSayWhyAndTouchNothing)
{
    m_dir.write("out.raw", "old");
    struct Case {
        Args args;
        int status;
        const char* message;
    };
    const Case cases[] = {
        {{"info", "v.raw", "--dims", "7,5,4", "--type", "short"},
         1,
         "v.raw: the file has 210 bytes, but 7 x 5 x 4 short take 280 bytes"},
        {{"info", "v.raw", "--dims", "7,5,3", "--type", "short", "--components", "2"}, 1, "take 420 bytes"},
        {Args{"info", "nothere.raw"} + kShape, 1, "nothere.raw: No such file or directory"},
        {Args{"flip", "v.raw", "--axis", "1", "-o", "v.raw"} + kShape, 2, "give --in-place to replace it"},
        {Args{"flip", "v.raw", "--axis", "3", "-o", "out.raw"} + kShape, 2,
         "--axis: '3' is not a whole number"},
        {Args{"flip", "v.raw", "-o", "out.raw"} + kShape, 2, "needs --axis A"},
        {{"info", "v.raw", "--dims", "7,5", "--type", "short"}, 2, "is not three numbers"},
        {{"info", "v.raw", "--dims", "7,5,3", "--type", "half"}, 2, "unknown type 'half'"},
        {Args{"info", "v.raw", "--axis", "1"} + kShape, 2, "option --axis does not apply to info"},
        {Args{"permute", "v.raw", "--order", "0,0,1", "-o", "out.raw"} + kShape, 2,
         "not an order of the axes"},
        {Args{"crop", "v.raw", "--min", "2,0,0", "--max", "1,4,2", "-o", "out.raw"} + kShape, 2,
         "the box is empty"},
        {Args{"downsample", "v.raw", "--block", "8,1,1", "-o", "out.raw"} + kShape, 1,
         "larger than the volume"},
        {{"downsample", "v.raw", "--block", "2,2,2", "--labels", "--components", "1", "-o", "out.raw",
          "--dims", "7,5,3", "--type", "float"},
         1,
         "file has 210 bytes"},
        {Args{"convert", "v.raw", "--to", "complex", "-o", "out.raw"} + kShape, 1,
         "only with --offset or --scale"},
        {Args{"convert", "v.raw", "--to", "byte", "-o", "/nonexistent/out.raw"} + kShape, 1,
         "cannot create a file"},
        {{"frobnicate", "v.raw"}, 2, "unknown command"},
    };
    for (const Case& c : cases) {
        const Outcome r = raw(c.args);
        EXPECT_EQ(r.status, c.status) << c.args[0] << " " << c.message << ": " << r.err;
        EXPECT_NE(r.err.find(c.message), std::string::npos) << r.err;
        EXPECT_EQ(r.out, "");
    }
    EXPECT_EQ(m_dir.read("out.raw"), "old");
    EXPECT_EQ(listing(), (Args{"out.raw", "v.raw"}));
}

TEST_F(ZmtoolRaw, InPlaceReplacesAndCtrlCLeavesEverythingAsItWas)
{
    const std::string original = m_dir.read("v.raw");
    for (int i = 0; i < 2; ++i) {
        const Outcome r = raw(Args{"flip", "v.raw", "--axis", "0", "--in-place"} + kShape);
        ASSERT_EQ(r.status, 0) << r.err;
        EXPECT_EQ(r.out, "v.raw: 7 x 5 x 3 short\n");
        EXPECT_NE(m_dir.read("v.raw"), i == 0 ? original : "");
    }
    EXPECT_EQ(m_dir.read("v.raw"), original);

    m_dir.write("out.raw", "old");
    for (const char* command : {"downsample", "convert"}) {
        const Args extra =
            std::strcmp(command, "convert") == 0 ? Args{"--to", "float"} : Args{"--block", "2,2,2"};
        for (const Args& target : {Args{"-o", "out.raw"}, Args{"--in-place"}}) {
            const Outcome r = raw(Args{command, "v.raw"} + kShape + extra + target, RunOptions{"", true});
            EXPECT_EQ(r.status, 130) << r.err;
            EXPECT_NE(r.err.find("canceled;"), std::string::npos) << r.err;
        }
    }
    EXPECT_EQ(m_dir.read("out.raw"), "old");
    EXPECT_EQ(m_dir.read("v.raw"), original);
    EXPECT_EQ(listing(), (Args{"out.raw", "v.raw"}));
}
