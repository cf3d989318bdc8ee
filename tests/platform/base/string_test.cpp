#include "platform/base/qx_string.h"

#include <bit>
#include <clocale>
#include <cmath>
#include <gtest/gtest.h>
#include <limits>
#include <random>

namespace {

TEST(String, CaseIsAsciiWhateverTheLocale) {
    const char* before = std::setlocale(LC_ALL, nullptr);
    const std::string saved = before == nullptr ? "C" : before;
    std::setlocale(LC_ALL, "tr_TR.UTF-8");
    EXPECT_EQ(String("title i \xC3\xA9").upper(), "TITLE I \xC3\xA9");
    EXPECT_EQ(String("TITLE I \xC3\x89").lower(), "title i \xC3\x89");
    EXPECT_TRUE(String::equalNoCase("MOD_count", "mod_COUNT"));
    EXPECT_FALSE(String::equalNoCase("mod", "mods"));
    std::setlocale(LC_ALL, saved.c_str());
}

TEST(WideText, AnyBytesComeBack) {
    std::mt19937 random(20261);
    for (int round = 0; round < 2000; ++round) {
        String bytes;
        for (auto i = random() % 12; i > 0; --i) {
            // Mostly bytes that begin or continue a sequence, where a decoder goes wrong.
            bytes.push_back(static_cast<char>(random() % 3 == 0 ? random() % 256 : 0x80 + random() % 128));
        }
        ASSERT_EQ(Qx::narrow(Qx::widen(bytes)), bytes) << "round " << round;
    }
}

TEST(WideText, Utf8IsCheckedStrictly) {
    for (const char* good : {"", "plain", "\xC3\xA9", "\xED\x9F\xBF", "\xF4\x8F\xBF\xBF"}) {
        EXPECT_TRUE(Qx::isUtf8(good)) << good;
    }
    for (const char* bad : {"\x80", "\xC0\x80", "\xC3", "\xE0\x80\x80", "\xED\xA0\x80", "\xF4\x90\x80\x80",
                            "\xF5", "a\xE2\x82", "\xFF"}) {
        EXPECT_FALSE(Qx::isUtf8(bad)) << bad;
    }
}

TEST(Numbers, DoublesReadBackAsTheSameBits) {
    std::mt19937_64 random(20262);
    std::vector<double> values{0.0,
                               -0.0,
                               0.1,
                               1.0 / 3,
                               1e99,
                               2e81,
                               -1.0,
                               5e-324,
                               std::numeric_limits<double>::max(),
                               1001.0 / 30000,
                               HUGE_VAL,
                               -HUGE_VAL};
    for (int i = 0; i < 5000; ++i) {
        values.push_back(std::bit_cast<double>(random()));
    }
    for (const double value : values) {
        double read = 7;
        ASSERT_TRUE(Qx::textToDouble(Qx::doubleToText(value), read)) << Qx::doubleToText(value);
        if (!std::isnan(value)) {
            ASSERT_EQ(std::bit_cast<uint64_t>(read), std::bit_cast<uint64_t>(value))
                << Qx::doubleToText(value);
        } else {
            ASSERT_TRUE(std::isnan(read));
        }
    }
}

TEST(Numbers, TheWholeTextMustBeANumber) {
    double number = 7;
    for (const char* text : {"", " 1", "1 ", "1,5", "1.5x", "0x10", "--1", "1e999"}) {
        EXPECT_FALSE(Qx::textToDouble(text, number)) << text;
    }
    EXPECT_EQ(number, 7);
    int whole = 7;
    for (const char* text : {"", "1.0", "2147483648", "-2147483649", "1a", " 1"}) {
        EXPECT_FALSE(Qx::textToInt(text, whole)) << text;
    }
    EXPECT_EQ(whole, 7);
    EXPECT_TRUE(Qx::textToInt("-2147483648", whole));
    EXPECT_EQ(whole, std::numeric_limits<int>::min());
}

} // namespace
