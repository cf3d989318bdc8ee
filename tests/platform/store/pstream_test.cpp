#include "platform/base/cookie.h"
#include "platform/base/id_stamp.h"
#include "platform/store/pstream.h"

#include <gtest/gtest.h>

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

} // namespace
