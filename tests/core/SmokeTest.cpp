#include <zmlib/zmlib.h>

#include <gtest/gtest.h>

TEST(ZmString, SmokeAppend)
{
    ZmString s("ab");
    s += 'c';
    EXPECT_STREQ(s.getString(), "abc");
}
