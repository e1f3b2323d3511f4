// zmtool bundle on a tree written by the library: printed back as the library prints it, values
// by path and by DICOM tag, and errors with their place.
#include "../BundleText.h"
#include "../RunProgram.h"

#include <gtest/gtest.h>

class ZmtoolBundle : public ZmtoolTest {};

TEST_F(ZmtoolBundle, PrintsGetsAndReportsThePlaceOfAnError)
{
    HxParamBundle tree("Scan");
    tree.setTag("G0028-0030", "0.7\\0.7");
    tree.bundle("Series 1", 1)->set("Slices", 212);
    const float spacing[3] = {0.5f, 0.5f, 1.25f};
    tree.set("VoxelSize", 3, spacing);
    m_dir.write("scan.hx", printedToFile(tree));

    const Outcome print = runProgram(m_dir, {m_tool, "bundle", "print", "scan.hx"});
    EXPECT_EQ(print.status, 0) << print.err;
    EXPECT_EQ(print.out, printed(tree));
    const struct {
        Args args;
        const char* out;
    } gets[] = {{{"Series/Slices"}, "212\n"},
                {{"voxelsize"}, "0.5 0.5 1.25\n"},
                {{"--tag", "0028,0030"}, "0.7\\0.7\n"}};
    for (const auto& g : gets) {
        Args args = {m_tool, "bundle", "get", "scan.hx"};
        args.insert(args.end(), g.args.begin(), g.args.end());
        const Outcome r = runProgram(m_dir, args);
        EXPECT_EQ(r.status, 0) << r.err;
        EXPECT_EQ(r.out, g.out);
    }
    EXPECT_EQ(runProgram(m_dir, {m_tool, "bundle", "get", "scan.hx", "Series/None"}).status, 1);
    EXPECT_EQ(runProgram(m_dir, {m_tool, "bundle", "get", "scan.hx", "--tag", "28,30"}).status, 2);

    m_dir.write("bad.hx", "Scan {\n    x 1 two\n}\n");
    const Outcome bad = runProgram(m_dir, {m_tool, "bundle", "print", "bad.hx"});
    EXPECT_EQ(bad.status, 1);
    EXPECT_EQ(bad.err,
              "zmtool bundle: bad.hx: line 2, column 7: expected numbers or a quoted text as the value\n");
}
