#include "platform/base/cookie.h"
#include "platform/base/id_stamp.h"
#include "platform/store/pstream.h"

#include <cmath>
#include <functional>
#include <gtest/gtest.h>
#include <limits>

namespace {

std::span<const std::byte> bytesOf(std::string_view text) {
    return std::as_bytes(std::span(text));
}

TEST(PStream, FormIsFixed) {
    PStream stream;
    stream.setUnsignedLong(0x04030201);
    stream.setUnsignedShort(0x0605);
    stream.setCookedChar(7);
    stream.setLong(-2);
    stream.setUnsignedLongLong(0x0807060504030201u);
    stream.setFloat(1.5f);
    stream.setDouble(-2.0);
    stream.setString("a\xC3\xA9");
    IdStamp(1, 2, 0x80000000u).pack(stream);
    black_cookie.pack(stream);
    stream.patchUnsignedLong(0, 0x0D0C0B0A);
    const std::string_view expected(
        "\x0A\x0B\x0C\x0D\x05\x06\x07\xFE\xFF\xFF\xFF\x01\x02\x03\x04\x05\x06\x07\x08"
        "\0\0\xC0\x3F\0\0\0\0\0\0\0\xC0\x03\0\0\0a\xC3\xA9"
        "\x01\0\0\0\x02\0\0\0\0\0\0\x80\x01\0\0\0\x87\x02\0\0E\0\0\0",
        62);
    EXPECT_EQ(std::string_view(reinterpret_cast<const char*>(stream.bytes().data()), stream.size()),
              expected);
    EXPECT_TRUE(stream.good());
}

TEST(PStream, ValuesComeBackAsTheSameBits) {
    PStream out;
    const double nan = -std::numeric_limits<double>::quiet_NaN();
    for (const double value : {0.0, -0.0, 1e-310, 1e99, std::numeric_limits<double>::infinity(), nan}) {
        out.setDouble(value);
    }
    out.setLong(std::numeric_limits<int32_t>::min());
    out.setString(std::string_view("\0\n\xFF", 3));
    PStream in(out.bytes());
    for (const double value : {0.0, -0.0, 1e-310, 1e99, std::numeric_limits<double>::infinity(), nan}) {
        const double read = in.getDouble();
        EXPECT_EQ(std::signbit(read), std::signbit(value));
        EXPECT_TRUE(read == value || std::isnan(value));
    }
    EXPECT_EQ(in.getLong(), std::numeric_limits<int32_t>::min());
    EXPECT_EQ(in.getString(), String(std::string_view("\0\n\xFF", 3)));
    EXPECT_TRUE(in.good());
    EXPECT_EQ(in.remaining(), 0u);
}

TEST(PStream, ShortReadIsAnErrorThatStays) {
    const std::vector<std::pair<size_t, std::function<bool(PStream&)>>> reads = {
        {4, [](PStream& s) { return s.getUnsignedLong() == 0; }},
        {4, [](PStream& s) { return s.getLong() == 0; }},
        {8, [](PStream& s) { return s.getUnsignedLongLong() == 0; }},
        {1, [](PStream& s) { return s.getCookedChar() == 0; }},
        {2, [](PStream& s) { return s.getUnsignedShort() == 0; }},
        {4, [](PStream& s) { return s.getFloat() == 0; }},
        {8, [](PStream& s) { return s.getDouble() == 0; }},
        {5, [](PStream& s) { return s.getString().empty(); }},
        {9, [](PStream& s) { return s.getSpan(9).empty(); }},
        {12,
         [](PStream& s) {
             IdStamp id(1, 1, 1);
             id.unpack(s);
             return !id.valid();
         }},
        {12,
         [](PStream& s) {
             cookie c = black_cookie;
             c.unpack(s);
             return !c.is_valid();
         }},
    };
    const std::string_view one("\x01\0\0\0\x01\0\0\0\x45\0\0\0", 12);
    for (size_t i = 0; i < reads.size(); ++i) {
        SCOPED_TRACE(i);
        PStream whole(bytesOf(one).first(reads[i].first));
        EXPECT_FALSE(reads[i].second(whole));
        EXPECT_TRUE(whole.good());
        PStream cut(bytesOf(one).first(reads[i].first - 1));
        EXPECT_TRUE(reads[i].second(cut));
        EXPECT_FALSE(cut.good());
        const size_t left = cut.remaining();
        EXPECT_EQ(cut.getCookedChar(), 0);
        EXPECT_EQ(cut.remaining(), left) << "a stream in its error state consumes nothing";
    }
}

TEST(PStream, CountsAndLengthsAreCheckedBeforeTheyAreTrusted) {
    PStream out;
    out.setUnsignedLong(3);
    out.setRaw("123456", 6);
    PStream fits(out.bytes());
    EXPECT_EQ(fits.getCount(2), 3u);
    PStream tooMany(out.bytes());
    EXPECT_EQ(tooMany.getCount(3), 0u);
    EXPECT_FALSE(tooMany.good());
    for (const uint32_t huge : {0x7FFFFFFFu, 0x80000000u, 0xFFFFFFFFu}) {
        PStream lie;
        lie.setUnsignedLong(huge);
        PStream text(lie.bytes());
        EXPECT_TRUE(text.getString().empty());
        EXPECT_FALSE(text.good());
        PStream count(lie.bytes());
        EXPECT_EQ(count.getCount(0), 0u);
        EXPECT_FALSE(count.good());
    }
    PStream raw(out.bytes());
    char to[20] = "unchanged";
    EXPECT_FALSE(raw.getRaw(to, 11));
    EXPECT_STREQ(to, "unchanged");
}

TEST(PStream, AlignmentFollowsThePlaceAndIsPassedOver) {
    for (unsigned place = 0; place < 20; ++place) {
        PStream stream;
        stream.setPlace(place);
        stream.setAlignment(8);
        EXPECT_EQ((place + stream.size()) % 8, 0U);
        EXPECT_LE(stream.size(), 8U);
        stream.setCookedChar(77);
        PStream reading{std::span<const std::byte>(stream.bytes())};
        reading.passAlignment();
        EXPECT_EQ(reading.getCookedChar(), 77) << place;
    }
    for (const std::string_view bad :
         {std::string_view("\x02\0", 2), std::string_view("\x02\0\1", 3), std::string_view()}) {
        PStream reading(bytesOf(bad));
        reading.passAlignment();
        EXPECT_FALSE(reading.good());
    }
}

TEST(PStream, GatheringGivesTheSameBytesInPieces) {
    const std::vector<std::byte> large(100'000, std::byte{'L'});
    const std::vector<std::byte> small(10, std::byte{'s'});
    const auto fill = [&](PStream& stream) {
        for (int i = 0; i < 3; ++i) {
            stream.setUnsignedLong(0);
            const size_t at = stream.size() - 4;
            stream.setString("before");
            stream.setLasting(large.data(), large.size());
            stream.setLasting(large.data() + 1, large.size() - 1);
            stream.setLasting(small.data(), small.size());
            stream.setAlignment(8);
            stream.patchUnsignedLong(at, 7 + static_cast<uint32_t>(i));
        }
    };
    PStream plain;
    PStream gathering;
    gathering.gather();
    fill(plain);
    fill(gathering);
    ASSERT_TRUE(gathering.good());
    ASSERT_EQ(gathering.size(), plain.size());
    EXPECT_LT(gathering.bytes().size(), 200U) << "what is large is not copied";
    for (size_t from = 0; from < plain.size(); from += from < 40 ? 1 : 4999) {
        std::vector<std::byte> joined;
        for (const std::span<const std::byte> piece : gathering.pieces(from)) {
            EXPECT_FALSE(piece.empty());
            joined.insert(joined.end(), piece.begin(), piece.end());
        }
        const std::vector<std::byte> expected(plain.bytes().begin() + static_cast<std::ptrdiff_t>(from),
                                              plain.bytes().end());
        ASSERT_EQ(joined, expected) << from;
    }
    EXPECT_TRUE(gathering.pieces(gathering.size()).empty());
    for (const size_t bad : {size_t{12}, size_t{14}, size_t{100'000}, gathering.size() - 2}) {
        PStream refused = gathering;
        refused.patchUnsignedLong(bad, 1);
        EXPECT_FALSE(refused.good()) << "four bytes that are referred to, or are not there: " << bad;
    }
    gathering.clear();
    EXPECT_EQ(gathering.size(), 0U);
}

TEST(PStream, MisuseIsAnErrorState) {
    PStream reading(bytesOf("abcd"));
    reading.setUnsignedLong(1);
    EXPECT_FALSE(reading.good());
    PStream writing;
    writing.setUnsignedShort(1);
    writing.patchUnsignedLong(0, 1);
    EXPECT_FALSE(writing.good());
}

} // namespace
