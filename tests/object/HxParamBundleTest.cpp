// Parameter trees: names, lookups and their type masks, structure edits, the text forms and the
// DICOM conventions, against the rules written out here.
#include "../BundleText.h"
#include "../FailureInjection.h"

#include <zmlib/HxParamBundle.h>
#include <zmlib/HxParamEditCheck.h>
#include <zmlib/ZmString.h>

#include <gtest/gtest.h>

#include <array>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <random>
#include <string>
#include <vector>

TEST(HxParamBundle, NamesAreSanitisedAndLookedUpCaseInsensitively)
{
    HxParamBundle root("Root");
    auto* p = new HxParameter("3D", 1);
    root.insert(p, 0);
    EXPECT_STREQ(p->name(), "_3D");
    EXPECT_EQ(root.find("3D"), p);
    auto* vs = new HxParameter("VoxelSize", 3, static_cast<const double*>(nullptr));
    root.insert(vs, 0);
    EXPECT_EQ(root.find("voxelsize extra words"), vs);
    EXPECT_STREQ(HxParameter("a b.c+d", 1).name(), "a_b_c_d");

    // Automatic names count per kind.
    HxParamBundle b1("");
    HxParamBundle b2(nullptr);
    HxParameter q1("", 0);
    HxParameter q2("", 0);
    EXPECT_EQ(std::atoi(b2.name() + 6), std::atoi(b1.name() + 6) + 1) << b1.name() << " " << b2.name();
    EXPECT_EQ(std::strncmp(q1.name(), "Parameter", 9), 0);
    EXPECT_EQ(std::atoi(q2.name() + 9), std::atoi(q1.name() + 9) + 1);

    // A bundle keeps its first word; the others become its aliases, found by bundle().
    auto* lab = new HxParamBundle("M\xfcller Lab Team");
    root.insert(lab, 0);
    EXPECT_STREQ(lab->name(), "Muller");
    const char* aliases = nullptr;
    ASSERT_TRUE(lab->findString("Name", aliases));
    EXPECT_STREQ(aliases, "Lab Team");
    EXPECT_EQ(root.bundle("team", 0), lab);
    lab->setName("Team");
    EXPECT_STREQ(lab->find("Name")->getString(), "Lab"); // the new name leaves the aliases

    // A rename marks the node 0x11 and everything above it 0x14.
    root.untouchAll(0xff);
    p->setName("Depth");
    EXPECT_EQ(p->isNew(0xff), 0x11);
    EXPECT_EQ(root.isNew(0xff), 0x14);
    p->setName(p->name()); // its own text: nothing
    root.untouchAll(0xff);
    p->set(7);
    EXPECT_EQ(p->isNew(0xff), 0x12);
    EXPECT_EQ(root.isNew(0xff), 0x18);
    root.untouchAll(0xff);
    p->set(7); // the same value: no change
    EXPECT_EQ(root.isNew(0xff), 0);
}

TEST(HxParamBundle, FindMasksAcceptTypesAtLeastAsWide)
{
    // Per type: the mask bits that accept it (complex, uint and sbyte are never found).
    const struct {
        ZmPrimType::Type type;
        int accepted;
    } rows[] = {{ZmPrimType::BYTE, 0x5f},   {ZmPrimType::SHORT, 0x5e}, {ZmPrimType::USHORT, 0x5e},
                {ZmPrimType::INT, 0x5c},    {ZmPrimType::FLOAT, 0x58}, {ZmPrimType::DOUBLE, 0x50},
                {ZmPrimType::STRING, 0x40}, {ZmPrimType::COMPLEX, 0},  {ZmPrimType::UINT, 0},
                {ZmPrimType::SBYTE, 0}};
    for (const auto& row : rows) {
        HxParamBundle b("B");
        b.insert(new HxParameter("v", 2, row.type, row.type == ZmPrimType::STRING ? "12 13" : nullptr), 0);
        for (int bit = 0x01; bit <= 0x40; bit <<= 1) {
            EXPECT_EQ(b.find("v", 0, bit) != nullptr, (row.accepted & bit) != 0)
                << ZmPrimType(row.type).getName() << " mask " << bit;
        }
    }
    HxParamBundle b("B");
    b.set("f", 2, static_cast<const float*>(nullptr));
    EXPECT_EQ(b.find("f", 3, 255), nullptr);
    EXPECT_NE(b.find("f", 2, 255), nullptr);
}

TEST(HxParamBundle, InsertReplaceRemoveKeepTheGroupsInOrder)
{
    HxParamBundle b("B");
    auto* first = new HxParameter("x", 1);
    first->setFlag(HxParamBase::NO_RENAME | HxParamBase::HIDDEN, 1);
    b.insert(first, 0);
    b.insert(new HxParameter("y", 2), 0);
    auto* sub = new HxParamBundle("S");
    b.insert(sub, 0); // sub-bundles go before the parameters
    EXPECT_EQ(b.nBundles(), 1);
    EXPECT_EQ(b.index(sub), 0);
    auto* again = new HxParameter("X", 3);
    b.insert(again, 1); // replaced in place, flags inherited
    EXPECT_EQ(b.index(again), 1);
    EXPECT_EQ(again->flag(0xff), HxParamBase::NO_RENAME | HxParamBase::HIDDEN);
    b.insert(new HxParameter("x", 4), 0); // a second one: find returns the first
    EXPECT_EQ(b.find("x")->getNum(0), 3);
    EXPECT_EQ(b.size(), 4);

    again->setFlag(HxParamBase::NO_DELETE, 1);
    b.remove(again);
    EXPECT_EQ(b.index(again), 1);
    EXPECT_EQ(b.editCheck()->checkDelete(again), 0);
    EXPECT_EQ(b.editCheck()->checkRename(again, "z"), 0);
    EXPECT_NE(b.editCheck()->checkInsertParam(&b, "z"), 0);
    b.remove("S");
    EXPECT_EQ(b.nBundles(), 0);
    EXPECT_EQ(b.index(nullptr), -1);
    EXPECT_EQ(b.bundle(0), nullptr);

    // Sorted lookups: lazily sorted, and unsorted again by an insertion.
    HxParamBundle many("M");
    for (int i = 99; i >= 0; --i) {
        many.set(("p" + std::to_string(i)).c_str(), i);
    }
    EXPECT_EQ(many.findSorted("P42")->getNum(0), 42);
    EXPECT_STREQ(many[0]->name(), "p0");
    many.set("a", 1);
    EXPECT_EQ(many.find("p7")->getNum(0), 7);

    // The boundary bundles name each other.
    HxParamBundle root("R");
    const char* other = nullptr;
    ASSERT_TRUE(root.boundaryIds(1)->findString("name", other));
    EXPECT_STREQ(other, "BoundaryConditions");
}

TEST(HxParamBundle, CopyMoveAndDuplicate)
{
    HxParamBundle src("Src");
    src.set("a", 1);
    src.bundle("Sub", 1)->set("b", 2.5);
    auto* skip = new HxParameter("secret", "s");
    skip->setFlag(HxParamBase::NO_COPY, 1);
    src.insert(skip, 0);

    HxParamBundle dst("Dst");
    dst.copy(src);
    EXPECT_EQ(dst.find("secret"), nullptr);
    EXPECT_EQ(printed(dst), "Dst {\n    Sub {\n        b 2.5\n    }\n    a 1\n}\n");
    src.bundle("Sub", 0)->set("c", 3);
    dst.copy(src); // merged into the existing sub-bundle
    EXPECT_EQ(dst.bundle("Sub", 0)->size(), 2);
    dst.copyAll(src);
    EXPECT_NE(dst.find("secret"), nullptr);
    const std::string before = printed(dst);
    dst.copy(dst);
    dst.copyAll(dst);
    EXPECT_EQ(printed(dst), before);

    HxParamBundle empty("E");
    std::unique_ptr<HxParamBase> twin(src.duplicate());
    empty.move(src);
    EXPECT_EQ(src.size(), 0);
    EXPECT_EQ(printed(empty), printed(static_cast<HxParamBundle&>(*twin)).replace(0, 3, "E"));
    EXPECT_EQ(empty.bundle("Sub", 0)->parent(), &empty);

    // A failed copy throws the memory exception and leaks nothing (ASan checks the rest).
    const FailureWalk walk =
        walkAllocationFailures([&] { std::unique_ptr<HxParamBase> c(empty.duplicate()); },
                               [](int64_t, bool threw) { EXPECT_TRUE(threw); });
    EXPECT_GT(walk.thrown, 5);
}

TEST(HxParamBundle, ValuesConvertAndPrint)
{
    HxParameter f("f", 2, std::array<float, 2>{-1.7f, 2.5f}.data());
    EXPECT_EQ(f.getNum(0), -1);
    EXPECT_EQ(f.getNum(1), 3);
    EXPECT_DOUBLE_EQ(f.getReal(0), double(-1.7f));
    EXPECT_EQ(HxParameter("s", "42 7").getNum(0), 42);
    const unsigned char bytes[3] = {1, 200, 3};
    HxParameter b("b", 3, ZmPrimType::BYTE, bytes);
    EXPECT_STREQ(b.getString(), "1 200 3");
    HxParameter d("d", 1.0 / 3);
    EXPECT_STREQ(d.getString(), "0.333333333333");
    EXPECT_STREQ(f.getString(), "-1.7 2.5");

    HxParamBundle root("Root");
    root.set("q", "a\"b\\");
    root.set("n", 2, std::array<int, 2>{-4, 5}.data());
    auto* hidden = new HxParameter("h", 1);
    hidden->setFlag(HxParamBase::HIDDEN, 1);
    root.insert(hidden, 0);
    auto* transient = new HxParameter("t", 1);
    transient->setFlag(HxParamBase::TRANSIENT, 1);
    root.insert(transient, 0);
    EXPECT_EQ(printed(root), "Root {\n    q \"a\\\"b\\ \"\n    n -4 5\n    t 1\n}\n");
    // In a file: commas up to the last non-transient child (the hidden one counts), no
    // transient children.
    EXPECT_EQ(printedToFile(root), "Root {\n    q \"a\\\"b\\ \",\n    n -4 5,\n}\n");
}

TEST(HxParamBundle, DicomTagsEnhancedSetsAndPrivateCreators)
{
    HxParamBundle root("Data");
    EXPECT_STREQ(root.findTag("G0028-0030", "none"), "none");
    root.setTag("G0028-0030", "0.5\\0.25");
    EXPECT_STREQ(root.findTag("G0028-0030", "none"), "0.5\\0.25");
    ZmDArray<float> spacing;
    ASSERT_TRUE(root.findTag("G0028-0030", spacing));
    ASSERT_EQ(spacing.size(), 2);
    EXPECT_EQ(spacing[1], 0.25f);
    float first = 0;
    EXPECT_TRUE(root.findTag("G0028-0030", first));
    EXPECT_EQ(first, 0.5f);
    root.setTag("G0008-0060", "CT");
    EXPECT_FALSE(root.findTag("G0008-0060", spacing));

    // Enhanced multi-frame: classic tags are mapped and found in the functional groups.
    HxParamBundle* all = root.dicomAll();
    all->bundle("G5200-9230", 1)->bundle("Item_1", 1)->set("G0018-9082", "Echo: 12");
    EXPECT_STREQ(all->findTagInAll("G0018-0081", "-"), "12");
    const HxParamBundle* perFrame = nullptr;
    const HxParamBundle* shared = all;
    EXPECT_TRUE(all->isEnhancedDcm(&perFrame, &shared));
    EXPECT_EQ(shared, nullptr);
    ZmString mapped;
    EXPECT_TRUE(HxParamBundle::replaceTag(ZmString("(0020,0100)"), mapped));
    EXPECT_EQ(mapped, "G0020-9128");
    EXPECT_FALSE(HxParamBundle::replaceTag(ZmString("(00zz,0100)"), mapped));

    // A creator found in "All", then two new ones taking the next free blocks of the group.
    all->set("G0029-0010", "PrivateCreator: ACME 1.0");
    all->set("G0029-1020", "Thing: 7");
    EXPECT_STREQ(all->findPrivateTagInAll("ACME 1.0", "G0029-xx20", "-"), "7");
    all->setPrivateTagInAll("Other", "G0029-xx05", "v");
    EXPECT_STREQ(all->find("G0029-0011")->getString(), "PrivateCreator: Other");
    EXPECT_STREQ(all->findPrivateTagInAll("Other", "G0029-xx05", "-"), "v");
    for (int i = 0; i < 9; ++i) {
        all->setPrivateTagInAll(("C" + std::to_string(i)).c_str(), "G0029-xx01", "x");
    }
    // Block 0x1A is written digit by digit from '0' (":"), which the name rules store as "_";
    // the blocks after it that would give the same name are passed over.
    EXPECT_NE(all->find("G0029-001_"), nullptr);
    all->setPrivateTagInAll("C9", "G0029-xx01", "y");
    EXPECT_STREQ(all->find("G0029-0020")->getString(), "PrivateCreator: C9");
    EXPECT_STREQ(all->findPrivateTagInAll("C8", "G0029-xx01", "-"), "x");
    HxParamBundle* item = all->privateSequenceItemInAll("Seq", "G0029-xx30", "a list", 2, true);
    ASSERT_NE(item, nullptr);
    EXPECT_STREQ(item->find("Description")->getString(), "Item 2");
    EXPECT_EQ(static_cast<const HxParamBundle*>(all)->privateSequenceItemInAll("Seq", "G0029-xx30", 2), item);
    all->setPrivateTagInAll("Other", "G0029-xx05", nullptr);
    EXPECT_STREQ(all->findPrivateTagInAll("Other", "G0029-xx05", "gone"), "gone");

    // The generated creators are transient: in a string, not in a file.
    EXPECT_NE(printed(root).find("PrivateCreators {"), std::string::npos);
    EXPECT_EQ(printedToFile(root).find("PrivateCreators"), std::string::npos);
}

namespace {

// A random tree of every value type, with texts full of quotes, backslashes and line breaks.
void grow(HxParamBundle& b, std::mt19937& rng, int depth)
{
    const char* const names[] = {"a", "Voxel size", "3D", "M\xfcller", "x.y", "", "G0029-0010"};
    const char* const texts[] = {"", "plain", "a\"b\\", "ends\\ ", "line\nbreak", "\\\"", " lead", "\\\\"};
    const int children = int(rng() % 6);
    for (int i = 0; i < children; ++i) {
        const char* name = names[rng() % 7];
        switch (rng() % 7) {
        case 0:
            if (depth < 4) {
                auto* sub = new HxParamBundle(name);
                b.insert(sub, 0);
                grow(*sub, rng, depth + 1);
            }
            break;
        case 1:
            b.insert(new HxParameter(name, texts[rng() % 8]), 0);
            break;
        default: {
            const ZmPrimType::Type types[] = {ZmPrimType::BYTE,   ZmPrimType::SHORT,  ZmPrimType::INT,
                                              ZmPrimType::FLOAT,  ZmPrimType::DOUBLE, ZmPrimType::COMPLEX,
                                              ZmPrimType::USHORT, ZmPrimType::UINT,   ZmPrimType::SBYTE};
            const ZmPrimType type = types[rng() % 9];
            const int n = int(rng() % 4);
            std::vector<unsigned char> bytes(size_t(n * type.size()));
            for (unsigned char& c : bytes) {
                c = static_cast<unsigned char>(rng());
            }
            b.insert(new HxParameter(name, n, type, bytes.data()), 0);
            break;
        }
        }
    }
}

} // namespace

TEST(HxParamBundle, ParseReadsBothPrintFormsBack)
{
    std::mt19937 rng(11);
    for (int round = 0; round < 300; ++round) {
        HxParamBundle tree("Root");
        grow(tree, rng, 0);
        for (const std::string& text : {printed(tree), printedToFile(tree)}) {
            HxParamBundle back("Other");
            const ZmResult r = back.parse(text.data(), text.size());
            ASSERT_TRUE(r.ok()) << r.text() << "\n" << text;
            EXPECT_EQ(printed(back), printed(tree)) << text;
        }
    }

    // Values read back as printed: the space after a final backslash goes, types are inferred.
    const char text[] = "K {\n    s \"x\\ \",\n    f 0.5 1.25,\n    d 0.333333333333\n    i -3 4\n}\n";
    HxParamBundle k("K");
    ASSERT_TRUE(k.parse(text, std::strlen(text)).ok());
    EXPECT_STREQ(k.find("s")->getString(), "x\\");
    EXPECT_EQ(int(k.find("f")->primType()), ZmPrimType::FLOAT);
    EXPECT_EQ(int(k.find("d")->primType()), ZmPrimType::DOUBLE);
    EXPECT_EQ(int(k.find("i")->primType()), ZmPrimType::INT);
    // A whole number that a float cannot hold keeps a mixed list in double (found by the fuzzer).
    const char mixed[] = "M {\n    m 69999999 1.25\n}\n";
    ASSERT_TRUE(k.parse(mixed, std::strlen(mixed)).ok());
    EXPECT_EQ(int(k.find("m")->primType()), ZmPrimType::DOUBLE);

    // Malformed input: the place and what was expected; the bundle stays as it was.
    const struct {
        const char* text;
        const char* message;
    } bad[] = {
        {"", "line 1, column 1: expected a bundle name"},
        {"A {\n  x 1 2 y\n}\n", "line 2, column 5: expected numbers or a quoted text as the value"},
        {"A {\n  s \"open\n}\n", "line 2, column 5: expected the closing quote of the text that starts here"},
        {"A {\n  B {\n  }\n", "line 4, column 1: expected \"}\" closing the bundle"},
        {"A {\n}\n}\n", "line 3, column 1: expected the end of the text after the bundle"},
        {"A\n", "line 1, column 2: expected \"{\" and the end of the line after the bundle name"},
    };
    HxParamBundle keep("Keep");
    keep.set("v", 1);
    for (const auto& c : bad) {
        const ZmResult r = keep.parse(c.text, std::strlen(c.text));
        EXPECT_EQ(r.code(), ZmResult::InvalidArgument);
        EXPECT_STREQ(r.text(), c.message) << c.text;
    }
    EXPECT_EQ(printed(keep), "Keep {\n    v 1\n}\n");
    std::string deep;
    for (int i = 0; i < 1100; ++i) {
        deep += "B {\n";
    }
    EXPECT_NE(std::string(keep.parse(deep.data(), deep.size()).text()).find("1000 nested"),
              std::string::npos);
}
