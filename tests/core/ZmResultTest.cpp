#include "LogCapture.h"

#include <zmlib/ZmResult.h>

#include <gtest/gtest.h>

#include <cerrno>
#include <cstring>
#include <string>
#include <thread>
#include <vector>

namespace {

TEST(ZmResult, CodeZeroIsSuccessWithoutRecord)
{
    LogCapture log;
    const ZmResult r(0, 12, "file.cpp", "text", "data");
    EXPECT_TRUE(r.ok());
    EXPECT_TRUE(bool(r));
    EXPECT_FALSE(r.failed());
    EXPECT_EQ(r.error(), nullptr);
    EXPECT_STREQ(r.text(), "");
    EXPECT_STREQ(r.file(), "");
    EXPECT_EQ(r.line(), 0);
    EXPECT_TRUE(LogCapture::lines().empty()) << "no record, so no trace line";
}

TEST(ZmResult, DataDefaultsToTheCodesText)
{
    const ZmResult invalid(ZmResult::InvalidArgument, "", "");
    EXPECT_STREQ(invalid.data(), "one of the arguments is invalid");
    EXPECT_TRUE(invalid.hasData());
    EXPECT_STREQ(ZmResult(17, "", "x").data(), "x");
    const ZmResult unknown(500, "", nullptr);
    EXPECT_TRUE(unknown.isBad());
    EXPECT_STREQ(unknown.data(), "");
    EXPECT_FALSE(unknown.hasData());
    // Only the kvError table knows 12 and 13; a plain record has no default for them.
    EXPECT_STREQ(ZmResult(12, nullptr, nullptr).data(), "");
    EXPECT_STREQ(ZmResult(4097, nullptr, nullptr).data(), "");
    EXPECT_STREQ(
        ZmResult(4104, nullptr, nullptr).data(),
        "Exec format error. An attempt was made to execute a file that is not executable or that has "
        "an invalid executable-file format. ");
    EXPECT_STREQ(ZmResult(ZmResult::Code(4132)).data(),
                 "Resource deadlock would occur. The argument to a math function is not in the domain of the "
                 "function.");
    EXPECT_EQ(std::strncmp(ZmResult(1285, nullptr, nullptr).data(), "OpenGL Error GL_OUT_OF_MEMORY - ", 32),
              0);
    EXPECT_STREQ(ZmResult(4133, nullptr, nullptr).data(), "");
}

TEST(ZmResult, RecordCarriesItsFieldsAndLeavesATraceLine)
{
    LogCapture log;
    const ZmResult r(ZmResult::OutOfRange, 42, "reader.cpp", "index 9", "size 3");
    EXPECT_EQ(r.code(), ZmResult::OutOfRange);
    EXPECT_EQ(r.codeValue(), 6);
    EXPECT_EQ(r.line(), 42);
    EXPECT_STREQ(r.file(), "reader.cpp");
    EXPECT_STREQ(r.text(), "index 9");
    ASSERT_EQ(LogCapture::lines().size(), 1u);
    EXPECT_EQ(LogCapture::lines()[0].substr(0, 2), "0|") << "debug level";
    EXPECT_NE(LogCapture::lines()[0].find(
                  "D [ZmResult::Error] code: 6 file: reader.cpp line: 42 message: index 9 data: size 3\n"),
              std::string::npos)
        << LogCapture::lines()[0];
    LogCapture::lines().clear();
    const ZmResult hex(0x1FF, "t", nullptr);
    EXPECT_EQ(LogCapture::matching("code: 1FF file:  line: 0 message: t data: \n").size(), 1u);
}

TEST(ZmResult, CopiesShareOneRecord)
{
    ZmResult a(ZmResult::NotSupported, "a", nullptr);
    {
        ZmResult b = a;
        EXPECT_EQ(b.error(), a.error());
        EXPECT_EQ(a.error()->refCount(), 2);
        ZmResult c;
        c = std::move(b);
        EXPECT_EQ(c.error(), a.error());
    }
    EXPECT_EQ(a.error()->refCount(), 1);
    a.clear();
    EXPECT_TRUE(a.ok());
}

TEST(ZmResult, ShiftKeepsTheFirstFailure)
{
    ZmResult a;
    const ZmResult b(ZmResult::ReadOnly, "b", nullptr);
    const ZmResult c(ZmResult::False, "c", nullptr);
    a << ZmResult() << b << c;
    EXPECT_EQ(a.error(), b.error());
    ZmResult target;
    EXPECT_EQ(&(c >> target), &target);
    EXPECT_EQ(target.error(), c.error());
    b >> target;
    EXPECT_EQ(target.error(), c.error());
}

TEST(ZmResult, MakeBadUsesTheDefaultTextAndZeroMeansSuccess)
{
    ZmResult r(ZmResult::InternalError, "old", "old data");
    r.makeBad(ZmResult::DataExpected);
    EXPECT_EQ(r.codeValue(), 3);
    EXPECT_STREQ(r.text(), "");
    EXPECT_STREQ(r.data(), "data expected");
    r.makeBad(0u);
    EXPECT_TRUE(r.ok());
}

TEST(ZmResult, ThrowOnFailThrowsASharingCopy)
{
    ZmResult ok;
    EXPECT_EQ(&ok.throwOnFail(), &ok);
    ZmResult bad(ZmResult::Interrupted, "stop", nullptr);
    try {
        bad.throwOnFail();
        FAIL() << "no exception";
    } catch (const ZmResult& thrown) {
        EXPECT_EQ(thrown.error(), bad.error());
    }
}

std::vector<char> g_calls;
bool callbackA(const ZmResult&)
{
    g_calls.push_back('A');
    return false;
}
bool callbackB(const ZmResult&)
{
    g_calls.push_back('B');
    return true;
}
bool callbackC(const ZmResult&)
{
    g_calls.push_back('C');
    return false;
}

TEST(ZmResult, NotifyCallsNewestFirstUntilOneIsDone)
{
    ZmResult::notificationCallbackRemoveAll();
    g_calls.clear();
    ZmResult::notificationCallbackAdd(callbackA);
    ZmResult::notificationCallbackAdd(callbackB);
    ZmResult::notificationCallbackAdd(callbackC);
    ZmResult().notify();
    EXPECT_TRUE(g_calls.empty());
    ZmResult bad(ZmResult::False, nullptr, nullptr);
    bad.notify();
    EXPECT_EQ(std::string(g_calls.begin(), g_calls.end()), "CB");
    ZmResult::notificationCallbackRemove(callbackB);
    ZmResult::notificationCallbackAdd(callbackC);
    ZmResult::notificationCallbackRemove(callbackC); // the newer C goes
    g_calls.clear();
    bad.notify();
    EXPECT_EQ(std::string(g_calls.begin(), g_calls.end()), "CA");
    ZmResult::notificationCallbackRemoveAll();
    g_calls.clear();
    bad.notify();
    EXPECT_TRUE(g_calls.empty());
}

TEST(Kv, ErrorTakesTheShortTableTextAndTheCallersContext)
{
    (void)Kv::lastError(false); // clears the thread's last error
    const ZmResult r = Kv::kvError(ZmResult::WriteFileFailed, "w.cpp", 7, "save", "Nov 21 2026", "10:00:00",
                                   "disk", true, false);
    EXPECT_STREQ(r.text(), "failed to write file");
    EXPECT_STREQ(r.data(), "disk\nin_function=save\ndate=Nov 21 2026\ntime=10:00:00");
    EXPECT_STREQ(r.file(), "w.cpp");
    EXPECT_EQ(r.line(), 7);
    EXPECT_TRUE(Kv::lastError(false).ok()) << "setLast was false";

    const ZmResult noData = Kv::kvError(ZmResult::OutOfMemory, "f", 1, "fn", "d", "t", nullptr, true, true);
    EXPECT_STREQ(noData.text(), "out of memory");
    EXPECT_STREQ(noData.data(), "in_function=fn\ndate=d\ntime=t");
    const ZmResult plain = Kv::kvError(ZmResult::Code(500), "f", 1, "fn", "d", "t", "raw", false, false);
    EXPECT_STREQ(plain.text(), "");
    EXPECT_STREQ(plain.data(), "raw");

    EXPECT_EQ(Kv::lastError(false).error(), noData.error());
    EXPECT_TRUE(Kv::lastError(false).ok()) << "the first call cleared it";
    Kv::setError(plain);
    EXPECT_EQ(Kv::lastError(true).error(), plain.error());
    EXPECT_EQ(Kv::lastError(false).error(), plain.error());
}

TEST(Kv, FailLogsTheBlockKeepsTheFirstLastErrorAndNotifies)
{
    ZmResult::notificationCallbackRemoveAll();
    ZmResult::notificationCallbackAdd(callbackA);
    g_calls.clear();
    (void)Kv::lastError(false); // clears the thread's last error
    LogCapture log(ZmLogError);
    EXPECT_FALSE(Kv::fail(ZmResult()));
    EXPECT_TRUE(LogCapture::lines().empty());

    const ZmResult first(ZmResult::Code(0xAB), 9, "x.cpp", "broken", "");
    const ZmResult second(ZmResult::InvalidArgument, 10, "y.cpp", "bad", nullptr);
    EXPECT_TRUE(Kv::fail(first));
    EXPECT_TRUE(Kv::fail(second));
    ASSERT_EQ(LogCapture::lines().size(), 2u);
    const std::string& line = LogCapture::lines()[0];
    EXPECT_EQ(line.substr(0, 2), "3|");
    EXPECT_NE(line.find("E [] \nFile: x.cpp\nLine: 9\nCode: AB\nText: broken\nData: \n"), std::string::npos)
        << line;
    EXPECT_NE(LogCapture::lines()[1].find("Code: 11\nText: bad\nData: one of the arguments is invalid\n"),
              std::string::npos);
    EXPECT_EQ(Kv::lastError(false).error(), first.error());
    EXPECT_EQ(std::string(g_calls.begin(), g_calls.end()), "AA");
    ZmResult::notificationCallbackRemoveAll();
}

TEST(Kv, FailWinAndLogWinFuncAddTheSystemText)
{
    LogCapture log;
    (void)Kv::lastError(false); // clears the thread's last error
    errno = ENOENT;
    EXPECT_TRUE(Kv::failWin(ZmResult(ZmResult::ReadFileFailed, 3, "r.cpp", "open", "path")));
    const std::string expected = std::string("open error[2 ") + std::strerror(ENOENT) + "]";
    const ZmResult last = Kv::lastError(false);
    EXPECT_EQ(std::string(last.text()), expected);
    EXPECT_STREQ(last.data(), "path");
    EXPECT_EQ(last.line(), 3);
    errno = EACCES;
    EXPECT_TRUE(Kv::failWin(ZmResult(ZmResult::ReadFileFailed, nullptr, nullptr)));
    EXPECT_EQ(std::string(Kv::lastError(false).text()),
              std::string("error[13 ") + std::strerror(EACCES) + "]");
    EXPECT_EQ(Kv::winError(), std::strerror(EACCES));
    EXPECT_FALSE(Kv::failWin(ZmResult()));

    LogCapture::lines().clear();
    EXPECT_FALSE(Kv::logWinFunc(5, 5, "write", "ok", false));
    EXPECT_TRUE(LogCapture::lines().empty());
    EXPECT_FALSE(Kv::logWinFunc(5, 5, "write", "ok", true));
    ASSERT_EQ(LogCapture::lines().size(), 1u);
    EXPECT_EQ(LogCapture::lines()[0], "1|write() ok\n");
    errno = ENOSPC;
    EXPECT_TRUE(Kv::logWinFunc(-1, 5, "write", nullptr, false));
    ASSERT_EQ(LogCapture::lines().size(), 2u);
    EXPECT_NE(LogCapture::lines()[1].find(std::string("write()  [-1 <> 5]: ") + std::strerror(ENOSPC) + "\n"),
              std::string::npos)
        << LogCapture::lines()[1];
}

TEST(Kv, LastErrorIsPerThread)
{
    (void)Kv::lastError(false); // clears the thread's last error
    const ZmResult mine(ZmResult::False, "main", nullptr);
    Kv::setError(mine);
    ZmResult seenByOther(ZmResult::InternalError, nullptr, nullptr);
    std::thread other([&] {
        seenByOther = Kv::lastError(true);
        // Left set on purpose: the thread's slot must be released when the thread ends (the
        // sanitizer build reports a leak otherwise).
        Kv::setError(ZmResult(ZmResult::ReadOnly, "other", nullptr));
    });
    other.join();
    EXPECT_TRUE(seenByOther.ok());
    EXPECT_EQ(Kv::lastError(false).error(), mine.error());
}

} // namespace
