// The out-of-memory and throwing-copy paths of the core types, walked failure point by failure
// point: every object must come out as its contract says, and ASan/LSan watch for leaks and
// double destruction.
#include "FailureInjection.h"
#include "ScratchDir.h"

#include <zmlib/ZmBitfield.h>
#include <zmlib/ZmDArray.h>
#include <zmlib/ZmException.h>
#include <zmlib/ZmLogFile.h>
#include <zmlib/ZmMemory.h>
#include <zmlib/ZmMemoryException.h>
#include <zmlib/ZmResult.h>
#include <zmlib/ZmString.h>
#include <zmlib/ZmStringTokenizer.h>
#include <zmlib/ZmStringTokenizerGeneral.h>

#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>
#include <filesystem>
#include <string>
#include <utility>
#include <vector>

namespace {

template <class T>
std::vector<int> values(const ZmDArray<T>& a)
{
    std::vector<int> out;
    for (int64_t i = 0; i < a.size(); ++i) {
        if constexpr (std::is_same_v<T, ZmString>) {
            out.push_back(a[i].toInt64() == 0 ? -1 : int(a[i].toInt64()));
        } else {
            out.push_back(a[i].value());
        }
    }
    return out;
}

} // namespace

TEST(FailureInjection, HookFailsExactlyTheChosenRequestAndIsRemovedAfterwards)
{
    {
        const FailAllocation fail(2);
        void* first = zmmalloc(8);
        EXPECT_THROW(zmrealloc(first, 64), ZmMemoryException); // the 2nd request
        std::memset(first, 1, 8);                              // the old block is still ours (ASan)
        first = zmrealloc(first, 64);
        zmfree(first);
        EXPECT_EQ(FailAllocation::failed(), 1);
    }
    zmfree(zmmalloc(8)); // no hook left behind
    const FailAllocation always(1, true);
    EXPECT_THROW(zmmalloc(1), ZmMemoryException);
    EXPECT_THROW(zmmalloc(1), ZmMemoryException);
}

// While every request fails, the exception of the failed request itself must still arrive
// intact: building, copying, throwing and asking it for its text may not allocate.
TEST(FailureInjection, MemoryExceptionArrivesWhileEveryRequestFails)
{
    void* p = zmmalloc(10);
    const FailAllocation always(1, true);
    try {
        zmfree(zmmalloc(100));
        FAIL() << "zmmalloc returned";
    } catch (const ZmMemoryException& e) {
        const ZmMemoryException copy(e);
        EXPECT_EQ(copy.getNumBytes(), 100u);
        EXPECT_STREQ(e.what(), "could not allocate 100 bytes");
    }
    try {
        zmrealloc(p, 1u << 20);
        FAIL() << "zmrealloc returned";
    } catch (const ZmException& e) {
        EXPECT_STREQ(e.what(), "could not allocate 1048576 bytes");
        try {
            e.raise(); // the base copy of a message-less exception
        } catch (const ZmException& raised) {
            EXPECT_STREQ(raised.what(), "");
        }
    }
    zmfree(p);
    EXPECT_GE(FailAllocation::failed(), 2);
}

// A copy that throws in the middle of an insert used to leave the size counting slots that held
// no element, which the destructor then destroyed (a double free). Every position and failing
// copy: the array keeps its elements and size.
TEST(FailureInjection, ArrayInsertWithThrowingCopiesRollsBack)
{
    ThrowingCopy::live() = 0;
    const ThrowingCopy src[3] = {7, 8, 9};
    for (int pos = 0; pos <= 3; ++pos) {
        for (int budget = 0; budget < 3; ++budget) {
            for (const bool roomy : {false, true}) {
                ZmDArray<ThrowingCopy> a;
                if (roomy) {
                    a.remax(10, 0);
                }
                for (int v : {1, 2, 3}) {
                    a.append(v);
                }
                const int64_t maxBefore = a.getMax();
                ThrowingCopy::budget() = budget;
                EXPECT_THROW(a.insert(pos, 3, src), ThrowingCopy::CopyFailed);
                ThrowingCopy::budget() = -1;
                EXPECT_EQ(values(a), (std::vector<int>{1, 2, 3})) << pos << " " << budget;
                EXPECT_EQ(ThrowingCopy::live(), 3 + 3);
                if (roomy) {
                    EXPECT_EQ(a.getMax(), maxBefore);
                }
                a.insert(pos, 1, src); // still usable: the block is the one getMax() reports
                EXPECT_EQ(a.size(), 4);
            }
        }
    }
    // A copy of a whole array whose element copy throws frees its block (LSan).
    ZmDArray<ThrowingCopy> full;
    full.append(3, src);
    ThrowingCopy::budget() = 1;
    EXPECT_THROW(ZmDArray<ThrowingCopy>{full}, ThrowingCopy::CopyFailed);
    ThrowingCopy::budget() = -1;
    EXPECT_EQ(ThrowingCopy::live(), 3 + 3);
}

// ZmDArray<ZmString>: a string copy that runs out of memory is the throwing copy of real code.
TEST(FailureInjection, ArrayOfStringsUnderEveryAllocationFailure)
{
    ZmDArray<ZmString> src;
    for (const char* s : {"4", "5", "6"}) {
        src.append(ZmString(s));
    }
    ZmDArray<ZmString> a;
    const FailureWalk walk = walkAllocationFailures(
        [&] {
            a = ZmDArray<ZmString>();
            a.remax(8, 0);
            for (const char* s : {"1", "2", "3"}) {
                a.append(ZmString(s));
            }
            a.insert(1, src.size(), src.dataPtr());
            a.insertSpace(0, 2);
            a.appendArray(src);
        },
        [&](int64_t, bool threw) {
            ASSERT_TRUE(threw);
            EXPECT_TRUE(a.isConsistent());
            for (int64_t i = 0; i < a.size(); ++i) {
                EXPECT_EQ(a[i].length(), a[i].isEmptyString() ? 0 : 1) << i;
            }
        });
    EXPECT_GT(walk.thrown, 8);
    EXPECT_EQ(values(a), (std::vector<int>{-1, -1, 1, 4, 5, 6, 2, 3, 4, 5, 6}));
}

// Every editing operation of a string, at every failure point: it throws ZmMemoryException and
// leaves the text (and so the terminator) as it was, or it completes.
TEST(FailureInjection, StringEditsKeepTheTextWhenTheHeapFails)
{
    using Edit = void (*)(ZmString&);
    const std::pair<const char*, Edit> edits[] = {
        {"+= char", [](ZmString& s) { s += 'x'; }},
        {"+= text", [](ZmString& s) { s += " and a much longer tail than the block has room for"; }},
        {"insertStr", [](ZmString& s) { s.insertStr(3, "inserted text that needs a bigger block"); }},
        {"replaceSubStr", [](ZmString& s) { s.replaceSubStr("o", "0000000000"); }},
        {"setInt64", [](ZmString& s) { s.setInt64(-1234567890123456789); }},
        {"assign", [](ZmString& s) { s = ZmString(std::string(300, 'a').c_str()); }},
        {"+ and substr", [](ZmString& s) { s = s + s.substr(1, 4) + s.protect(true); }},
        {"explode",
         [](ZmString& s) {
             ZmDArray<ZmString> parts;
             s.explode(' ', parts);
             s = parts[1];
         }},
        // The one documented exception: printf keeps the start of the new text.
        {"printf", [](ZmString& s) { s.printf("%s %d %s", "formatted", 42, std::string(200, 'p').c_str()); }},
    };
    for (const auto& [name, edit] : edits) {
        SCOPED_TRACE(name);
        const bool keepsText = std::string(name) != "printf";
        const FailureWalk walk = walkAllocationFailures(
            [edit = edit, keepsText] {
                ZmString s("hello, world of strings");
                const std::string before = s.getString();
                try {
                    edit(s);
                } catch (const ZmMemoryException&) {
                    EXPECT_EQ(s.length(), int(std::strlen(s.getString())));
                    if (keepsText) {
                        EXPECT_EQ(s.getString(), before);
                    } else {
                        EXPECT_EQ(std::string("formatted 42 ").compare(0, 13, s.getString(), 13), 0);
                    }
                    throw;
                }
            },
            [](int64_t, bool threw) { EXPECT_TRUE(threw); });
        EXPECT_GE(walk.thrown, 1);
    }
}

// Tokenizers and bit fields have no partial states to inspect: a failure throws, leaks nothing
// (LSan), and the same work done again without the hook gives the full answer.
TEST(FailureInjection, TokenizersAndBitFieldsThrowCleanly)
{
    const char* text = "one \"two three\" four\\\" \"\" five";
    const std::vector<std::string> expected = {"one", "two three", "four\"", "", "five"};
    std::vector<std::string> tokens;
    const auto tokenize = [&] {
        tokens.clear();
        ZmStringTokenizer t(text);
        while (t.hasMoreTokens()) {
            tokens.emplace_back(t.nextToken().getString());
        }
    };
    EXPECT_GE(walkAllocationFailures(tokenize, [](int64_t, bool threw) { EXPECT_TRUE(threw); }).thrown, 1);
    tokenize();
    EXPECT_EQ(tokens, expected);

    const auto general = [&] {
        tokens.clear();
        const ZmString source("a;b;;c"); // the tokenizer does not copy its text
        ZmStringTokenizerGeneral t(source, ";");
        while (t.hasMoreTokens()) {
            tokens.emplace_back(t.nextToken().getString());
        }
    };
    EXPECT_GE(walkAllocationFailures(general, [](int64_t, bool threw) { EXPECT_TRUE(threw); }).thrown, 1);

    ZmBitfield bits(100, ZmBitfield::CLEAR);
    bits.setRange(10, 20);
    const ZmBitfield reference = bits;
    walkAllocationFailures(
        [&] {
            ZmBitfield copy(bits);
            copy.resize(5000, ZmBitfield::SET);
            bits = copy; // fails before anything changes: the target keeps its bits
            ZmString hex;
            bits.md5(hex);
            bits = reference;
        },
        [&](int64_t, bool threw) {
            EXPECT_TRUE(threw);
            EXPECT_TRUE(bits == reference || bits.nBits() == 5000);
            bits = reference;
        });
    EXPECT_TRUE(bits == reference);
}

namespace {
// Built before the failure walks: a line argument made by the caller is the caller's allocation.
const ZmString& prebuiltLine()
{
    static const ZmString line(std::string(300, 'y').c_str());
    return line;
}
} // namespace

// The log never throws: at every failure point each writing operation completes or drops its
// line (and the log keeps working afterwards); results pass the failure on as the exception of a
// failed allocation and leave the thread's last error intact.
TEST(FailureInjection, LogNeverThrowsAndResultsFailCleanly)
{
    ScratchDir dir;
    ZmLogFile& log = getTheLogInstance();
    const std::string oldFolder = log.baseFolder();
    const int64_t oldCount = log.maxNumLogFiles();
    log.setBaseFolder(dir.path());
    log.setMaxNumLogFiles(3); // every open of the walk makes a file: keep the folder small
    ASSERT_TRUE(log.open(true));
    const std::string longText(300, 'x');
    (void)prebuiltLine();
    using Write = void (*)(ZmLogFile&, const char*);
    const std::pair<const char*, Write> writes[] = {
        {"trace", [](ZmLogFile& l, const char* t) { l.trace(ZmLogWarning, "module", t); }},
        {"tracef", [](ZmLogFile& l, const char* t) { l.tracef(ZmLogError, nullptr, "%s %d", t, 7); }},
        {"errorf", [](ZmLogFile& l, const char* t) { l.errorf("%s", t); }},
        {"warn", [](ZmLogFile& l, const char* t) { l.warn("module", t); }},
        {"printf", [](ZmLogFile& l, const char* t) { l.printf("%s", t); }},
        {"print", [](ZmLogFile& l, const char* t) { l.print("module", t); }},
        {"writeLine", [](ZmLogFile& l, const char*) { l.writeLine(ZmLogWarning, prebuiltLine()); }},
        {"setDefaultModule", [](ZmLogFile& l, const char* t) { l.setDefaultModule(t); }},
        {"open", [](ZmLogFile& l, const char*) { (void)l.open(true); }},
    };
    for (const auto& [name, write] : writes) {
        SCOPED_TRACE(name);
        const FailureWalk walk = walkAllocationFailures(
            [&, write = write] {
                // Every run starts from the same folder: an open whose clean-up ran out of memory
                // leaves its new file and the old ones, and more files mean more failure points.
                for (const auto& e : std::filesystem::directory_iterator(dir.path())) {
                    std::filesystem::remove(e.path());
                }
                write(log, longText.c_str());
            },
            [](int64_t, bool threw) { EXPECT_FALSE(threw); });
        EXPECT_EQ(walk.thrown, 0);
    }
    log.warn("module", "after the walks");
    log.flush();
    EXPECT_TRUE(log.isOpen());
    log.close();
    log.setBaseFolder(oldFolder);
    log.setMaxNumLogFiles(oldCount);

    const ZmResult kept(ZmResult::InvalidArgument, "kept", nullptr);
    Kv::setError(kept);
    const FailureWalk results = walkAllocationFailures(
        [] {
            ZmResult r(ZmResult::OutOfRange, 12, "file.cpp", "a text", "some data");
            (void)Kv::fail(r);
            ZmResult copy = r;
            copy << ZmResult(ZmResult::NotSupported, "second", nullptr);
        },
        [&](int64_t, bool) {
            const ZmResult last = Kv::lastError(true);
            EXPECT_TRUE(last.codeValue() == ZmResult::InvalidArgument ||
                        last.codeValue() == ZmResult::OutOfRange);
        });
    EXPECT_GT(results.thrown, 0);
}
