#include "tests/tools/qmedit_fixture.h"

namespace {

class QmeditApply : public Qmedit {
protected:
    void SetUp() override { m_edit = imported(kShortList); }
    /// "from-to" in frames of each pair of the first channel with a letter.
    std::string pairs(const std::string& letter) {
        std::string text;
        const nlohmann::json edit = shown(m_edit);
        for (const auto& channel : edit["channels"])
            if (channel["type"] == letter)
                for (const auto& pair : channel["pairs"])
                    text += pair["in"].dump() + "-" + pair["out"].dump() + " ";
        return text;
    }
    String m_edit;
};

TEST_F(QmeditApply, TimesAreTimecodeFramesOrSeconds) {
    EXPECT_EQ(pairs("A"), "0-250 ");
    for (const char* times : {"10:00:01:00-10:00:03:00", "25f-75f", "1s-3s", "1.004s-75f"}) {
        const test::ProgramResult result =
            run({"apply", "remove", "--dry-run", "--to", m_edit + "@" + times});
        EXPECT_EQ(result.code, 0) << result.err;
        EXPECT_NE(result.out.find(
                      "A1  changed  10:00:01:00-10:00:10:00; 00:00:10:00 long before, 00:00:08:00 after"),
                  String::npos)
            << result.out;
    }
}

TEST_F(QmeditApply, AShotIsLaidByNameAndCountedFromItsBeginning) {
    const nlohmann::json list = nlohmann::json::parse(run({"list", "--type", "shot", "--json"}).out);
    const std::string shot = list[0]["cookie"];
    ASSERT_EQ(list[0]["name"], "harbour"); // begins at 00:00:10:00
    for (const char* times : {"", "@25f-50f", "@1s-2s", "@00:00:11:00-00:00:12:00"}) {
        const test::ProgramResult result =
            run({"apply", "insert", "--channels", "V", "--from", shot + times, "--to", m_edit + "@0s"});
        ASSERT_EQ(result.code, 0) << result.err;
        const nlohmann::json edit = shown(m_edit);
        const nlohmann::json& laid = edit["channels"][0]["pairs"][0];
        EXPECT_EQ(laid["name"], "harbour");
        EXPECT_EQ(laid["strip_in"], *times == '\0' ? 250 : 275) << times;
    }
}

TEST_F(QmeditApply, ATrialChangesNothingAndAnOperationIsKept) {
    const auto before = snapshot();
    ASSERT_EQ(run({"apply", "lift", "--to", m_edit + "@1s-3s", "--dry-run"}).code, 0);
    EXPECT_TRUE(snapshot() == before);
    ASSERT_EQ(run({"apply", "7", "--to", m_edit + "@1s-3s", "--channels", "A1"}).code, 0);
    EXPECT_EQ(pairs("A"), "0-25 25-75 75-250 ");
    const auto backup = snapshot();
    EXPECT_TRUE(backup.at("P0001000/" + m_edit + ".qme.U1") == before.at("P0001000/" + m_edit + ".qme"));
    const test::ProgramResult diff =
        run({"diff", m_edit, project() + "/P0001000/" + m_edit + ".qme", "--json"});
    ASSERT_EQ(diff.code, 0) << diff.err;
    EXPECT_EQ(nlohmann::json::parse(diff.out)["same"], true);
}

TEST_F(QmeditApply, LostSyncIsToldAndDiffTellsWhere) {
    const String other =
        folder.write("E0099000.qme", snapshot().at("P0001000/" + m_edit + ".qme")); // as it was
    const test::ProgramResult result =
        run({"apply", "insert", "--from", m_edit + "@0s-2s", "--to", m_edit + "@1s", "--channels", "V"});
    ASSERT_EQ(result.code, 0) << result.err;
    EXPECT_NE(result.out.find("A1  is 00:00:02:00 earlier than the picture"), String::npos) << result.out;
    const test::ProgramResult diff = run({"diff", other, m_edit, "--json"});
    ASSERT_EQ(diff.code, 0) << diff.err;
    const nlohmann::json json = nlohmann::json::parse(diff.out);
    EXPECT_EQ(json["channels"][0]["channel"], "V1");
    EXPECT_EQ(json["channels"][0]["spans"][0]["from"], 25);
    EXPECT_EQ(json["channels"][0]["end_after"], 300);
    EXPECT_EQ(json["channels"][1]["channel"], "A1"); // silence to the picture's end
    EXPECT_EQ(json["channels"][1]["spans"][0]["from"], 250);
}

TEST_F(QmeditApply, DiffTellsPairByPairWhatBecameOfAState) {
    ASSERT_EQ(run({"apply", "lift", "--to", m_edit + "@1s-2s", "--channels", "V"}).code, 0);
    const test::ProgramResult text = run({"diff", m_edit + ".U1", m_edit});
    ASSERT_EQ(text.code, 0) << text.err;
    EXPECT_NE(text.out.find("\n  - "), String::npos) << text.out;
    EXPECT_NE(text.out.find("  black\n"), String::npos) << text.out;
    const nlohmann::json json = nlohmann::json::parse(run({"diff", m_edit, m_edit + ".u1", "--json"}).out);
    ASSERT_EQ(json["channels"].size(), 1u);
    const nlohmann::json& picture = json["channels"][0];
    EXPECT_EQ(picture["channel"], "V1");
    EXPECT_EQ(json["before"], json["after"]);
    // Lifting made black of a second; going back takes it away.
    size_t black = 0;
    for (const nlohmann::json& pair : picture["removed"]) {
        black += pair["kind"] == "black" ? 1 : 0;
    }
    EXPECT_EQ(black, 1u);
    EXPECT_EQ(picture["spans"].size(), 1u);
    EXPECT_EQ(picture["spans"][0]["from_s"], 1.0);
    EXPECT_EQ(picture["spans"][0]["to_s"], 2.0);
    EXPECT_GE(picture["added"].size(), 1u);
}

TEST_F(QmeditApply, WhatIsWrongIsNamedAndChangesNothing) {
    const auto before = snapshot();
    struct Case {
        std::vector<std::string> arguments;
        int code;
        std::string text;
    };
    const Case cases[] = {
        {{"apply", "move", "--to", m_edit}, 2, "is no operation"},
        {{"apply", "0", "--to", m_edit}, 2, "is no operation"},
        {{"apply", "insert", "--to", m_edit}, 2, "--from"},
        {{"apply", "lift", "--to", "E0@1s-2s"}, 1, "'E0' is neither the cookie nor the name"},
        {{"apply", "lift", "--to", m_edit + "@1s-2s", "--channels", "V9"}, 1, "there is no V9: " + m_edit},
        {{"apply", "lift", "--to", m_edit + "@1s-"}, 2, "lacks a time"},
        {{"apply", "lift", "--to", m_edit + "@1s-2s", "--channels", "X"}, 2, "names no channel"},
        {{"apply", "lift", "--to", "E0ZZZ000@1s-2s"}, 1, "there is no edit"},
        {{"apply", "lift", "--dry-run", "--to", m_edit + "@1x-2s"}, 1, "is no time"},
        {{"apply", "lift", "--dry-run", "--to", m_edit + "@09:00:00:00"}, 1, "before the edit's start"},
        {{"apply", "lift", "--dry-run", "--to", m_edit + "@3s"}, 1, "two different marks"},
        {{"apply", "lift", "--dry-run", "--to", m_edit + "@3s-3s"}, 1, "two different marks"},
        {{"apply", "lift", "--dry-run", "--to", m_edit}, 1, "no marked region"},
        {{"diff", m_edit, "nothing.qme"}, 1, "neither an edit of the project"},
    };
    for (const Case& its : cases) {
        const test::ProgramResult result = run(its.arguments);
        EXPECT_EQ(result.code, its.code) << result.err;
        EXPECT_NE(result.err.find(its.text), String::npos) << result.err;
        EXPECT_EQ(lines(result.err), 1u) << result.err;
    }
    EXPECT_TRUE(snapshot().at("P0001000/" + m_edit + ".qme") == before.at("P0001000/" + m_edit + ".qme"));
    EXPECT_EQ(snapshot().count("P0001000/" + m_edit + ".qme.U1"), 0u);
}

} // namespace
