#include "platform/base/cookie.h"

#include <gtest/gtest.h>

namespace {

struct TextCase {
    cookie item;
    const char* text;
};

TEST(Cookie, TextFormsAreFixed) {
    const TextCase cases[] = {
        {cookie(Cookie_Type::Project, 1, 0), "P0001000"},
        {cookie(Cookie_Type::Edit, 35, 36), "E000Z010"},
        {cookie(Cookie_Type::Edit, 36 * 36 * 36 * 36 - 1, 36 * 36 * 36 - 1), "EZZZZZZZ"},
        {black_cookie, "E00010HZ"},
        {clipboard_cookie, "E00050HZ"},
    };
    for (const TextCase& c : cases) {
        EXPECT_EQ(c.item.asString(), c.text);
        EXPECT_EQ(cookie(c.text), c.item) << c.text;
        EXPECT_EQ(cookie(Qx::widen(c.text)), c.item) << c.text;
        EXPECT_STREQ(cookie_string(c.item).c_str(), c.text);
        EXPECT_TRUE(c.item.isStorable()) << c.text;
    }
}

TEST(Cookie, OnlyItsOwnTextIsRead) {
    const std::string_view bad[] = {
        "",
        "E",
        "E000100",
        "E00010000",
        "e0001000",
        "E0001 00",
        "Q0001000",
        "I0001000",
        "E../../a",
        "E000/000",
        "E000.000",
        "E000-001",
        "EE00\xC3\xA9"
        "0",
        std::string_view("E000\0"
                         "000",
                         8),
        std::string_view("E0001000\0", 9),
    };
    for (const std::string_view text : bad) {
        EXPECT_FALSE(cookie(text).is_valid()) << text;
        EXPECT_EQ(cookie(text), invalid_cookie) << text;
    }
    for (const cookie& item :
         {cookie(Cookie_Type::Edit, 36 * 36 * 36 * 36, 0), cookie(Cookie_Type::Edit, 0, 36 * 36 * 36),
          cookie(Cookie_Type::Edit, -1, 0)}) {
        EXPECT_FALSE(item.isStorable()) << "words beyond the text";
    }
    EXPECT_EQ(cookie("e000z00a", true), cookie(Cookie_Type::Edit, 35, 10));
    EXPECT_FALSE(cookie("e000z00a", false).is_valid());
}

TEST(Cookie, MagicItems) {
    struct Case {
        cookie item;
        bool magic, black, graph, alias, input, clipboard;
    };
    const Case cases[] = {
        {black_cookie, true, true, false, false, false, false},
        {effect_graph_cookie, true, false, true, false, false, false},
        {alias_cookie, false, false, false, true, false, false},
        {input_cookie, true, false, false, false, true, false},
        {clipboard_cookie, true, false, false, false, false, true},
        {cookie(Cookie_Type::Edit, 1, 646), false, false, false, false, false, false},
        {cookie(Cookie_Type::Video, 900, 647), true, false, false, false, false, false},
        {invalid_cookie, false, false, false, false, false, false},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.item.asString());
        EXPECT_EQ(c.item.isMagic(), c.magic);
        EXPECT_EQ(c.item.isBlack(), c.black);
        EXPECT_EQ(c.item.isEffectGraph(), c.graph);
        EXPECT_EQ(c.item.isAlias(), c.alias);
        EXPECT_EQ(c.item.isInput(), c.input);
        EXPECT_EQ(c.item.isClipboard(), c.clipboard);
    }
}

TEST(Cookie, StoredWordsAreNotTrusted) {
    EXPECT_EQ(cookie::fromWords(7, 8, 'E'), cookie(Cookie_Type::Edit, 7, 8));
    for (const uint32_t third : {0u, uint32_t{'I'}, uint32_t{'Q'}, uint32_t{'E'} + 256u, 0xFFFFFFFFu}) {
        EXPECT_EQ(cookie::fromWords(7, 8, third), invalid_cookie) << third;
    }
}

} // namespace
