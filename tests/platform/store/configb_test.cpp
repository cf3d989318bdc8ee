#include "platform/store/configb.h"
#include "platform/store/pstream.h"
#include "platform/store/text_file.h"

#include <bit>
#include <clocale>
#include <cmath>
#include <functional>
#include <gtest/gtest.h>
#include <limits>

namespace {

struct Listener : Dirtiable {
    void onConfigbDirty() override { ++heard; }
    int heard = 0;
};

/// A store with a value of every type and the difficult ones of each.
configb difficult() {
    configb header("EDIT", "END_EDIT_HEADER");
    header.setInt("Least", std::numeric_limits<int>::min());
    header.setInt64("small int64", 5);
    header.setInt64("large", std::numeric_limits<int64_t>::max());
    header.setDouble("third", 1.0 / 3);
    header.setDouble("minus zero", -0.0);
    header.setDouble("infinity", -std::numeric_limits<double>::infinity());
    header.setDouble("payload", std::bit_cast<double>(uint64_t{0xFFF8000000000123}));
    header.setString("empty", "");
    header.setString("blanks", "  both ends ");
    header.setString("escapes", String(std::string_view("a\\n\nb\rc\td\0e\x7F\\", 14)));
    header.setString("unicode", "\xE5\xA4\x9C\xF0\x9F\x8E\xAC\xC2\x85\xE2\x80\xA8");
    header.setString("no unicode", "\xFF\xFE");
    header.setString("marker", "END_EDIT_HEADER");
    header.setCookie("none", invalid_cookie);
    header.setCookie("black", black_cookie);
    header.setCookie("not storable", cookie(Cookie_Type::Material, -1, 1 << 20));
    header.setBool("yes", true);
    header.setBool("no", false);
    return header;
}

TEST(Configb, EveryValueSurvivesBothForms) {
    configb header = difficult();
    TextFile text;
    text.setText("something before\n");
    header.writeTo(text);
    text.appendLine("something after");
    EXPECT_EQ(text[1], "EDIT");
    EXPECT_EQ(text[2], "Least:int -2147483648");
    TextFile reread;
    reread.setText(text.text());
    configb fromText("EDIT", "END_EDIT_HEADER");
    unsigned after = 0;
    const Qx::Status status = fromText.buildFrom(reread, 1, after);
    ASSERT_TRUE(status) << status.reason();
    EXPECT_EQ(fromText, header);
    EXPECT_EQ(reread[after], "something after");
    for (const String& key : header.keys()) {
        EXPECT_EQ(fromText.find(key)->index(), header.find(key)->index()) << key;
    }

    PStream packed;
    header.pack(packed);
    PStream stream(packed.bytes());
    configb unpacked;
    unpacked.unpack(stream);
    EXPECT_TRUE(stream.good());
    EXPECT_EQ(stream.remaining(), 0u);
    EXPECT_EQ(unpacked, header);
}

TEST(Configb, TypesThatAreNotKnownAreKept) {
    TextFile text;
    text.setText("EDIT\ntvtype:textdata pal \\n raw\nX:odd\nEND\n");
    configb header("EDIT", "END");
    unsigned after = 0;
    ASSERT_TRUE(header.buildFrom(text, 0, after));
    EXPECT_EQ(after, 4u);
    EXPECT_EQ(header.getString("TVTYPE"), "pal \\n raw");
    PStream packed;
    header.pack(packed);
    PStream stream(packed.bytes());
    configb copy("EDIT", "END");
    copy.unpack(stream);
    EXPECT_EQ(copy, header);
    TextFile again;
    copy.writeTo(again);
    EXPECT_EQ(again.text(), "EDIT\ntvtype:textdata pal \\n raw\nX:odd \nEND\n");
    EXPECT_TRUE(copy.setString("X", ""));
    EXPECT_FALSE(copy == header) << "the same text of another type is a change";
}

TEST(Configb, ErrorsNameTheLineAndChangeNothing) {
    const struct {
        const char* line;
        const char* names;
    } cases[] = {
        {"no colon", "KEY:type value"},
        {":int 1", "KEY:type value"},
        {"A\tB:int 1", "KEY:type value"},
        {"A:", "no type"},
        {"A: 1", "no type"},
        {"A:int", "int"},
        {"A:int 1.5", "int"},
        {"A:int 2147483648", "int"},
        {"A:int64 9223372036854775808", "int64"},
        {"A:double 1,5", "double"},
        {"A:double bits 99999999999999999999", "double"},
        {"A:string bad \\q escape", "string"},
        {"A:string cut \\x4", "string"},
        {"A:string cut \\", "string"},
        {"A:cookie ../../etc", "cookie"},
        {"A:cookie words 1 2", "cookie"},
        {"A:cookie words 1 2 3", "cookie"},
        {"A:bool maybe", "bool"},
    };
    for (const auto& each : cases) {
        SCOPED_TRACE(each.line);
        TextFile text;
        text.setText(String("EDIT\nGOOD:int 1\n") + each.line + "\nEND\n");
        configb header("EDIT", "END");
        header.setInt("old", 3);
        unsigned after = 77;
        const Qx::Status status = header.buildFrom(text, 0, after);
        ASSERT_FALSE(status);
        EXPECT_NE(status.reason().find("line 3:"), String::npos) << status.reason();
        EXPECT_NE(status.reason().find(each.names), String::npos) << status.reason();
        EXPECT_EQ(header.keys(), std::vector<String>{"old"});
        EXPECT_EQ(after, 77u);
    }
    TextFile text;
    text.setText("EDIT\nA:int 1\n");
    configb header("EDIT", "END");
    unsigned after = 0;
    EXPECT_NE(header.buildFrom(text, 0, after).reason().find("END"), String::npos);
    EXPECT_FALSE(header.buildFrom(text, 1, after)) << "the block begins with the name";
    EXPECT_FALSE(header.buildFrom(text, 9, after));
    text.setText("EDIT\nA:int 1\na:double 2 \nEND\n");
    ASSERT_TRUE(header.buildFrom(text, 0, after));
    EXPECT_EQ(header.getDouble("A"), 2.0) << "the later line wins";
    EXPECT_EQ(header.size(), 1u);
}

TEST(Configb, HostilePackedFormsAreRefusedWhole) {
    configb header;
    header.setInt("old", 3);
    const auto refused = [&](const std::function<void(PStream&)>& write, uint32_t count) {
        PStream out;
        out.setUnsignedLong(count);
        write(out);
        PStream in(out.bytes());
        header.unpack(in);
        return !in.good() && header.keys() == std::vector<String>{"old"};
    };
    const auto entry = [](const char* key, uint8_t type) {
        return [=](PStream& out) {
            out.setString(key);
            out.setCookedChar(type);
            out.setString("textdata\n");
            out.setString("value\n");
        };
    };
    EXPECT_TRUE(refused(entry("A", 99), 1));
    EXPECT_TRUE(refused(entry("A", 7), 1)) << "a foreign type with a line end would break the text form";
    EXPECT_TRUE(refused(entry("A:B", 4), 1));
    EXPECT_TRUE(refused([&](PStream& out) { entry("A", 6)(out); }, 1)) << "a bool is 0 or 1";
    const auto flag = [](const char* key) {
        return [=](PStream& out) {
            out.setString(key);
            out.setCookedChar(6);
            out.setCookedChar(1);
        };
    };
    EXPECT_TRUE(refused(
        [&](PStream& out) {
            flag("twice")(out);
            flag("TWICE")(out);
        },
        2));
}

TEST(Configb, KeysAreMatchedWithoutCaseInAnyLocale) {
    const String before = std::setlocale(LC_ALL, nullptr);
    for (const char* locale : {"C", "C.UTF-8", "tr_TR.UTF-8", "de_DE.UTF-8"}) {
        if (std::setlocale(LC_ALL, locale) == nullptr) {
            continue;
        }
        configb header;
        EXPECT_TRUE(header.setDouble("Title_\xC3\x84", 1.5));
        EXPECT_EQ(header.getDouble("tITLE_\xC3\x84"), 1.5) << locale;
        EXPECT_FALSE(header.contains("title_\xC3\xA4")) << "only ASCII letters fold";
        EXPECT_TRUE(header.setDouble("TITLE_\xC3\x84", 2.5));
        TextFile text;
        header.writeTo(text);
        EXPECT_EQ(text[1], "Title_\xC3\x84:double 2.5") << "the first spelling stays";
    }
    std::setlocale(LC_ALL, before.c_str());
}

TEST(Configb, ReadsConvertWhereNothingIsLost) {
    configb header;
    header.setInt("one", 1);
    header.setInt("two", 2);
    header.setInt64("wide", int64_t{1} << 40);
    header.setInt64("odd", (int64_t{1} << 53) + 1);
    header.setInt64("most", std::numeric_limits<int64_t>::max());
    header.setDouble("whole", 7.0);
    header.setDouble("half", 0.5);
    header.setDouble("huge", 9.3e18);
    header.setDouble("nan", std::nan(""));
    header.setBool("yes", true);
    header.setString("text", "5");
    EXPECT_EQ(header.getDouble("two"), 2.0);
    EXPECT_EQ(header.getInt("wide", -1), -1);
    EXPECT_EQ(header.getDouble("wide"), 1099511627776.0);
    EXPECT_EQ(header.getDouble("odd", -1), -1);
    EXPECT_EQ(header.getDouble("most", -1), -1);
    EXPECT_EQ(header.getInt("whole"), 7);
    EXPECT_EQ(header.getInt("half", -1), -1);
    EXPECT_EQ(header.getInt64("huge", -1), -1);
    EXPECT_EQ(header.getInt64("nan", -1), -1);
    EXPECT_TRUE(header.getBool("one"));
    EXPECT_FALSE(header.getBool("two"));
    EXPECT_EQ(header.getInt("yes"), 1);
    EXPECT_EQ(header.getInt("text", -1), -1);
    EXPECT_EQ(header.getString("one", "none"), "none");
    EXPECT_EQ(header.getCookie("absent"), invalid_cookie);
}

TEST(Configb, ChangesAreHeardOnceAndOnlyIfTheyAreSome) {
    Listener listener;
    configb header("EDIT", "END", &listener);
    const auto step = [&](bool done, bool changed) {
        const bool heard = listener.heard == 1 && header.isDirty();
        const bool silent = listener.heard == 0 && !header.isDirty();
        EXPECT_TRUE(changed ? heard : silent);
        listener.heard = 0;
        header.setDirty(false);
        return done;
    };
    EXPECT_TRUE(step(header.setInt("A", 1), true));
    EXPECT_TRUE(step(header.setInt("a", 1), false));
    EXPECT_TRUE(step(header.setInt64("A", 1), true));
    EXPECT_TRUE(step(header.setDouble("N", std::nan("")), true));
    EXPECT_TRUE(step(header.setDouble("N", std::nan("")), false));
    for (const char* bad : {"", "a:b", "a\nb", "a\x7F"}) {
        EXPECT_FALSE(step(header.setInt(bad, 1), false));
    }
    configb copy(header);
    copy.setInt("B", 2);
    step(true, false);
    EXPECT_TRUE(copy.isDirty());
    header = copy;
    step(true, true);
    header = copy;
    step(true, false);
    EXPECT_EQ(header.name(), "EDIT");
    EXPECT_TRUE(step(header.remove("n"), true));
    EXPECT_FALSE(step(header.remove("n"), false));
    header.clear();
    step(true, true);
    header.clear();
    step(true, false);
}

TEST(Configb, RemovingManyKeysKeepsTheOthersInOrder) {
    configb header;
    constexpr int count = 100000;
    for (int i = 0; i < count; ++i) {
        header.setInt("KEY" + std::to_string(i), i);
    }
    for (int i = 0; i < count; ++i) {
        if (i % 10000 != 7) {
            ASSERT_TRUE(header.remove("key" + std::to_string(i)));
        }
    }
    ASSERT_EQ(header.size(), 10u);
    EXPECT_EQ(header.keys().front(), "KEY7");
    EXPECT_EQ(header.keys().back(), "KEY90007");
    EXPECT_EQ(header.getInt("KEY50007"), 50007);
    header.setInt("KEY1", 1);
    EXPECT_EQ(header.keys().back(), "KEY1");
    configb same;
    for (const String& key : header.keys()) {
        same.setInt(key, header.getInt(key));
    }
    EXPECT_EQ(same, header) << "what was removed leaves no trace";
}

} // namespace
