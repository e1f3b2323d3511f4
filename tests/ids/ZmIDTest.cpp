#include <zmlib/KvSessionContextID.h>
#include <zmlib/Zm128.h>
#include <zmlib/ZmFrameID.h>
#include <zmlib/ZmID.h>
#include <zmlib/ZmRemotificationID.h>
#include <zmlib/ZmTransferID.h>
#include <zmlib/ZmUUID.h>
#include <zmlib/ZmUniqueID.h>

#include <gtest/gtest.h>

#include <climits>
#include <cstdint>
#include <cstdlib>
#include <random>
#include <string>
#include <vector>

namespace {

/// A ZmID whose value can be set from outside, for the generic operations.
template <class T, T e>
ZmID<T, e> idOf(T v)
{
    ZmID<T, e> id;
    id.valueSet(v);
    return id;
}

/// Every comparison of \p a and \p b agrees with the same comparison of \p x and \p y.
template <class Id, class V>
::testing::AssertionResult comparesLike(const Id& a, const Id& b, V x, V y)
{
    const bool got[6] = {a == b, a != b, a<b, a <= b, a> b, a >= b};
    const bool want[6] = {x == y, x != y, x<y, x <= y, x> y, x >= y};
    for (int i = 0; i < 6; ++i) {
        if (got[i] != want[i]) {
            return ::testing::AssertionFailure() << "operator #" << i << " for " << x << " vs " << y;
        }
    }
    return ::testing::AssertionSuccess();
}

/// Empty semantics and signed ordering of one ZmID instance over \p values (which include the
/// empty value and values of both signs).
template <class T, T e>
void checkInstance(const std::vector<T>& values)
{
    ZmID<T, e> fresh;
    EXPECT_EQ(fresh.value(), e);
    EXPECT_TRUE(fresh.isEmpty());
    EXPECT_FALSE(fresh.isNotEmpty());
    for (T v : values) {
        ZmID<T, e> id = idOf<T, e>(v);
        EXPECT_EQ(id.isEmpty(), v == e) << v;
        EXPECT_EQ(id.isNotEmpty(), v != e) << v;
        ZmID<T, e> copy(id);
        EXPECT_TRUE(copy == id);
        id.makeEmpty();
        EXPECT_TRUE(id.isEmpty());
        EXPECT_EQ(copy.value(), v) << "the copy is independent";
        for (T w : values) {
            EXPECT_TRUE(comparesLike(idOf<T, e>(v), idOf<T, e>(w), v, w));
        }
    }
}

} // namespace

TEST(ZmID, EveryInstanceHasItsEmptyValueAndSignedOrder)
{
    checkInstance<int, 0>({0, 1, -1, 7, INT_MAX, INT_MIN});
    checkInstance<int, -1>({-1, 0, 1, -2, INT_MAX, INT_MIN});
    checkInstance<int64_t, 0>({0, 1, -1, INT64_MAX, INT64_MIN, int64_t(1) << 40});
    checkInstance<int64_t, -1>({-1, 0, 1, -2, INT64_MAX, INT64_MIN});
    checkInstance<int64_t, INT64_MIN>({INT64_MIN, INT64_MIN + 1, -1, 0, 1, INT64_MAX});

    // The INT64_MIN instance: 0 and -1 are ordinary values, and the empty one sorts first.
    const ZmID<int64_t, INT64_MIN> empty;
    EXPECT_TRUE((idOf<int64_t, INT64_MIN>(0).isNotEmpty()));
    EXPECT_TRUE((idOf<int64_t, INT64_MIN>(-1).isNotEmpty()));
    EXPECT_TRUE((empty < idOf<int64_t, INT64_MIN>(INT64_MIN + 1)));
}

TEST(ZmID, ClassValuedIdentifiersFollowTheirValue)
{
    ZmID_C<Zm128> none;
    EXPECT_FALSE(none.isValid());
    EXPECT_EQ(none.value(), Zm128());
    ZmID_C<Zm128> a;
    a.valueSet(Zm128(0, 1));
    EXPECT_TRUE(a.isValid());
    ZmID_C<Zm128> b(Zm128(0x8000000000000000ull, 0));
    EXPECT_TRUE(comparesLike(a, b, 1, 2)); // a < b: the first word decides, unsigned
    EXPECT_TRUE(comparesLike(b, b, 0, 0));

    ZmID_C<ZmUUID> u;
    EXPECT_FALSE(u.isValid());
    u.valueSet(ZmUUID::fromString("000000000000000000000000000000FF"));
    EXPECT_TRUE(u.isValid());
    EXPECT_TRUE(comparesLike(ZmID_C<ZmUUID>(), u, 0, 1));
}

TEST(Zm128, OrdersFirstThenSecondWordUnsigned)
{
    const Zm128 high(0x8000000000000000ull, 0);
    const Zm128 one(1, 0);
    EXPECT_TRUE(comparesLike(high, one, 2, 1)) << "a set top bit is large, not negative";
    EXPECT_EQ(Zm128::compare(high, one), 1);
    EXPECT_EQ(Zm128::compare(one, high), -1);
    EXPECT_EQ(Zm128::compare(one, one), 0);
    EXPECT_TRUE(comparesLike(Zm128(1, ~0ull), Zm128(2, 0), 1, 2)) << "the second word only breaks ties";
    EXPECT_TRUE(comparesLike(Zm128(5, 0x8000000000000000ull), Zm128(5, 7), 2, 1));
    EXPECT_FALSE(Zm128().isValid());
    EXPECT_TRUE(Zm128(0, 1).isValid());
    EXPECT_TRUE(Zm128(1, 0).isValid());
    EXPECT_EQ(zm_hash(Zm128(0x1122334455667788ull, 0x99)), 0x55667788u);
}

TEST(ZmRemotificationID, ReservedRangesAndSingletonNames)
{
    struct Row {
        const ZmRemotificationID& id;
        int value;
        const char* name;
    };
    const Row rows[] = {
        {ZmRemotificationID::RS_SERVER_PEER, 1, "KvServerPeer"},
        {ZmRemotificationID::RS_BACKEND_PEER, 2, "KvBackendPeer"},
        {ZmRemotificationID::RS_TRANSFER_MANAGER, 3, "KvTransferManager"},
        {ZmRemotificationID::RS_LOAD_MANAGER, 4, "ExLoadManager"},
        {ZmRemotificationID::RS_DATA_MANAGER, 5, "ExDataManager"},
        {ZmRemotificationID::RS_VOLUME_INFO_CACHE, 6, "KvVolumeInfoCache"},
        {ZmRemotificationID::RS_ERROR_NOTIFIER, 7, "KvErrorNotifier"},
        {ZmRemotificationID::RS_POWERSCRIBE_CTRL, 9, "KvPowerScribeCtrl"},
    };
    for (const Row& r : rows) {
        EXPECT_EQ(r.id.value(), r.value);
        ASSERT_NE(r.id.singletonClassName(), nullptr) << r.value;
        EXPECT_STREQ(r.id.singletonClassName(), r.name);
    }
    EXPECT_EQ(ZmRemotificationID::RS_MAX.value(), 9);
    EXPECT_EQ(ZmRemotificationID::RS_LAST_SINGLETON_ID.value(), 20);

    // Walk 0..22 with next(): the only way besides the constants to reach a given number.
    ZmRemotificationID id;
    EXPECT_TRUE(id.isEmpty());
    EXPECT_EQ(id.singletonClassName(), nullptr);
    for (int v = 0; v <= 22; ++v) {
        EXPECT_EQ(id.value(), v);
        EXPECT_EQ(id.isReserved(), v >= 1 && v <= 20) << v;
        EXPECT_EQ(id.isReservedSingleton(), v >= 1 && v <= 9) << v;
        if (v == 8) {
            EXPECT_EQ(id.singletonClassName(), nullptr) << "8 is left unused";
        }
        id.next(true);
    }
}

TEST(ZmRemotificationID, NextCountsTheConstObjectItself)
{
    const ZmRemotificationID counter = ZmRemotificationID::RS_DATA_MANAGER; // 5
    const ZmRemotificationID first = counter.next(true);
    const ZmRemotificationID second = counter.next(true);
    EXPECT_EQ(first.value(), 6);
    EXPECT_EQ(second.value(), 7);
    EXPECT_EQ(counter.value(), 7);
    EXPECT_EQ(counter.next(false).value(), 6);
    EXPECT_EQ(counter.value(), 6);
    EXPECT_EQ(ZmRemotificationID::RS_DATA_MANAGER.value(), 5) << "the constant it was copied from stays";
}

TEST(KvSessionContextID, EmptyIsMinusOneAndStillValid)
{
    const KvSessionContextID none;
    EXPECT_EQ(int(none), -1);
    EXPECT_TRUE(none.isEmpty());
    EXPECT_TRUE(none.isValid());
    EXPECT_FALSE(KvSessionContextID(-2).isValid());
    EXPECT_FALSE(KvSessionContextID(INT_MIN).isValid());
    EXPECT_TRUE(KvSessionContextID(0).isValid());
    EXPECT_TRUE(KvSessionContextID(0).isNotEmpty());

    const int values[] = {INT_MIN, -2, -1, 0, 1, INT_MAX};
    for (int x : values) {
        for (int y : values) {
            const KvSessionContextID a(x);
            const KvSessionContextID b(y);
            EXPECT_EQ(KvSessionContextID::compare(a, b), x < y ? -1 : (x > y ? 1 : 0));
            EXPECT_TRUE(comparesLike(a, b, x, y));
            EXPECT_EQ(a == y, x == y) << "compares with an int through the conversion";
        }
    }
}

TEST(ZmFrameID, ValidityAndOpenRangeBounds)
{
    const ZmFrameID none;
    EXPECT_TRUE(none.isEmpty());
    EXPECT_TRUE(none.isValid()) << "the empty frame counts as valid, as intended";
    EXPECT_FALSE(ZmFrameID::fromInt64(-2).isValid());
    EXPECT_FALSE(ZmFrameID::fromInt64(INT64_MIN).isValid());
    EXPECT_TRUE(ZmFrameID::fromInt64(0).isValid());

    // Every combination of set/empty bounds against a model of the rule.
    const int64_t frames[] = {INT64_MIN, -2, -1, 0, 3, 4, 5, 9, 10, 11, INT64_MAX};
    const int64_t firsts[] = {-1, 4, 10};
    const int64_t lasts[] = {-1, 4, 10};
    for (int64_t f : frames) {
        for (int64_t lo : firsts) {
            for (int64_t hi : lasts) {
                const bool want = (lo == -1 || lo <= f) && (hi == -1 || f <= hi);
                EXPECT_EQ(
                    ZmFrameID::fromInt64(f).isInRange(ZmFrameID::fromInt64(lo), ZmFrameID::fromInt64(hi)),
                    want)
                    << f << " in [" << lo << ", " << hi << "]";
            }
        }
    }
    // The four cases by name.
    const ZmFrameID f7 = ZmFrameID::fromInt64(7);
    EXPECT_TRUE(f7.isInRange(ZmFrameID(), ZmFrameID()));
    EXPECT_TRUE(f7.isInRange(ZmFrameID(), ZmFrameID(7)));
    EXPECT_FALSE(f7.isInRange(ZmFrameID(), ZmFrameID(6)));
    EXPECT_TRUE(f7.isInRange(ZmFrameID(7), ZmFrameID()));
    EXPECT_FALSE(f7.isInRange(ZmFrameID(8), ZmFrameID()));
    EXPECT_TRUE(f7.isInRange(ZmFrameID(7), ZmFrameID(7)));
    EXPECT_FALSE(f7.isInRange(ZmFrameID(8), ZmFrameID(6)));
}

TEST(ZmUniqueID, CompareIsSignedAndTextsAreDecimal)
{
    const ZmUniqueID neg = ZmUniqueID::fromInt64(-5);
    const ZmUniqueID big(INT64_MAX);
    EXPECT_EQ(ZmUniqueID::compare(neg, big), -1);
    EXPECT_EQ(ZmUniqueID::compare(big, neg), 1);
    EXPECT_EQ(ZmUniqueID::compare(neg, ZmUniqueID(-5)), 0);
    EXPECT_TRUE(ZmUniqueID().isEmpty());
    EXPECT_TRUE(ZmTransferID().isEmpty());
    EXPECT_STREQ(ZmUniqueID(INT64_MIN).toZmString().getString(), "-9223372036854775808");
    EXPECT_STREQ(ZmTransferID(INT64_MAX).toZmString().getString(), "9223372036854775807");
    EXPECT_STREQ(ZmFrameID().toZmString().getString(), "-1");
    EXPECT_TRUE(ZmUniqueID::fromLatin1(nullptr).isEmpty());
    EXPECT_TRUE(ZmTransferID::fromLatin1("").isEmpty());
    EXPECT_EQ(ZmFrameID::fromLatin1("").value(), 0) << "no number reads as 0, which is a frame";
}

TEST(ZmUniqueID, FromLatin1ReadsLikeStrtoll)
{
    // Plain decimal texts within range, with the decorations the runtime accepts or stops at:
    // leading white space, a sign, leading zeros, trailing text.
    std::mt19937_64 rng(20240611);
    const char* const prefixes[] = {"", " ", "\t  ", "+", "-", "00", "- ", "x"};
    const char* const suffixes[] = {"", " ", "abc", ".5", "e3", "-1"};
    for (int i = 0; i < 2000; ++i) {
        const int digits = 1 + int(rng() % 18);
        std::string text = prefixes[rng() % 8];
        text += char('0' + rng() % 10);
        for (int d = 1; d < digits; ++d) {
            text += char('0' + rng() % 10);
        }
        text += suffixes[rng() % 6];
        const long long want = std::strtoll(text.c_str(), nullptr, 10);
        EXPECT_EQ(ZmUniqueID::fromLatin1(text.c_str()).value(), want) << text;
        EXPECT_EQ(ZmTransferID::fromLatin1(text.c_str()).value(), want) << text;
        EXPECT_EQ(ZmFrameID::fromLatin1(text.c_str()).value(), want) << text;
        // And back: the decimal text of the value reads to the same value.
        const ZmUniqueID u(want);
        EXPECT_EQ(ZmUniqueID::fromLatin1(u.toZmString().getString()), u);
        EXPECT_EQ(std::to_string(want), u.toZmString().getString());
    }
}
