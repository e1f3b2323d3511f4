#include <zmlib/ZmException.h>
#include <zmlib/ZmMemoryException.h>

#include <gtest/gtest.h>

#include <cstdint>
#include <cstdio>
#include <memory>
#include <stdexcept>
#include <string>
#include <typeinfo>

namespace {

/// A subclass that rethrows itself and clones itself, as a caller's own exception type would.
class TaggedException : public ZmException {
public:
    explicit TaggedException(int tag) : ZmException("tagged %d", tag), m_tag(tag) {}
    int tag() const { return m_tag; }

protected:
    ZmException* doClone() const override { return new TaggedException(*this); }
    [[noreturn]] void doRaise() const override { throw TaggedException(*this); }

private:
    int m_tag;
};

/// A subclass that keeps the base clone and throws a foreign type from doRaise.
class ForeignRaise : public ZmException {
public:
    ForeignRaise() : ZmException("foreign") {}

protected:
    [[noreturn]] void doRaise() const override { throw std::runtime_error("not ours"); }
};

class PlainSubclass : public ZmException {
public:
    PlainSubclass() = default; // the protected empty-message constructor
};

} // namespace

TEST(ZmException, FormatsItsMessageLikePrintf)
{
    const ZmException e("%s=%d (%5.2f) %c%%", "answer", 42, 3.14159, 'x');
    EXPECT_STREQ(e.what(), "answer=42 ( 3.14) x%");

    // A text well beyond a string's first block.
    const std::string word(300, 'w');
    char expected[400];
    std::snprintf(expected, sizeof expected, "[%s] %08x", word.c_str(), 0xbeefu);
    const ZmException longer("[%s] %08x", word.c_str(), 0xbeefu);
    EXPECT_STREQ(longer.what(), expected);

    EXPECT_STREQ(PlainSubclass().what(), "");
}

TEST(ZmException, CopiesOwnTheirMessage)
{
    ZmString text("first");
    const ZmException fromString(text);
    text = "changed";
    EXPECT_STREQ(fromString.what(), "first");

    ZmException copy(fromString);
    EXPECT_STREQ(copy.what(), "first");
    EXPECT_NE(copy.what(), fromString.what());
    copy = ZmException("second %d", 2);
    EXPECT_STREQ(copy.what(), "second 2");
    EXPECT_STREQ(fromString.what(), "first");
}

TEST(ZmException, CloneDispatchesToTheVirtualCopy)
{
    const ZmException base("base");
    const std::unique_ptr<ZmException> baseClone(base.clone());
    const ZmException& baseRef = *baseClone;
    EXPECT_EQ(typeid(baseRef), typeid(ZmException));
    EXPECT_STREQ(baseClone->what(), "base");
    EXPECT_NE(baseClone.get(), &base);

    const TaggedException tagged(7);
    const std::unique_ptr<ZmException> taggedClone(tagged.clone());
    const ZmException& taggedRef = *taggedClone;
    ASSERT_EQ(typeid(taggedRef), typeid(TaggedException));
    EXPECT_EQ(static_cast<const TaggedException&>(taggedRef).tag(), 7);

    // Without an override the copy is of the base type.
    const ForeignRaise foreign;
    const std::unique_ptr<ZmException> foreignClone(foreign.clone());
    const ZmException& foreignRef = *foreignClone;
    EXPECT_EQ(typeid(foreignRef), typeid(ZmException));
    EXPECT_STREQ(foreignClone->what(), "foreign");
}

TEST(ZmException, RaiseAlwaysThrowsTheBaseType)
{
    const ZmException base("plain %d", 1);
    try {
        base.raise();
    } catch (const ZmException& e) {
        EXPECT_EQ(typeid(e), typeid(ZmException));
        EXPECT_STREQ(e.what(), "plain 1");
    }

    const TaggedException tagged(3);
    bool caughtBase = false;
    try {
        tagged.raise();
    } catch (const TaggedException&) {
        ADD_FAILURE() << "the subclass thrown by doRaise must not leave raise";
    } catch (const ZmException& e) {
        caughtBase = true;
        EXPECT_EQ(typeid(e), typeid(ZmException));
        EXPECT_STREQ(e.what(), "tagged 3");
    }
    EXPECT_TRUE(caughtBase);

    // Only ZmException is caught and rethrown; anything else passes through untouched.
    EXPECT_THROW(ForeignRaise().raise(), std::runtime_error);
}

TEST(ZmException, IsCatchableAsStdException)
{
    try {
        throw ZmException("via %s", "std::exception");
    } catch (const std::exception& e) {
        EXPECT_STREQ(e.what(), "via std::exception");
    }
    try {
        throw ZmMemoryException(64);
    } catch (const std::exception& e) {
        EXPECT_STREQ(e.what(), "could not allocate 64 bytes");
    }
    EXPECT_THROW(throw ZmMemoryException(), ZmException);
}

TEST(ZmMemoryException, TextNamesTheRequestedSize)
{
    EXPECT_STREQ(ZmMemoryException().what(), "could not allocate enough memory");
    EXPECT_EQ(ZmMemoryException().getNumBytes(), 0u);
    EXPECT_STREQ(ZmMemoryException(0).what(), "could not allocate enough memory");
    const ZmMemoryException e64(64);
    EXPECT_EQ(e64.getNumBytes(), 64u);
    EXPECT_STREQ(e64.what(), "could not allocate 64 bytes");
    EXPECT_STREQ(e64.what(), "could not allocate 64 bytes");
    const ZmMemoryException largest(UINT64_MAX);
    EXPECT_EQ(largest.getNumBytes(), UINT64_MAX);
    EXPECT_STREQ(largest.what(), "could not allocate 18446744073709551615 bytes");
    const ZmException& asBase = largest;
    EXPECT_STREQ(asBase.what(), "could not allocate 18446744073709551615 bytes");
}

TEST(ZmMemoryException, CopiesCarryTheCount)
{
    const ZmMemoryException original(4096);
    const ZmMemoryException copy(original);
    EXPECT_EQ(copy.getNumBytes(), 4096u);
    EXPECT_STREQ(copy.what(), "could not allocate 4096 bytes");

    ZmMemoryException assigned;
    assigned = original;
    EXPECT_EQ(assigned.getNumBytes(), 4096u);
    EXPECT_STREQ(assigned.what(), "could not allocate 4096 bytes");
    assigned = ZmMemoryException(0);
    EXPECT_STREQ(assigned.what(), "could not allocate enough memory");
}
