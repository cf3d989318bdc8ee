#include "tests/tools/qmedit_fixture.h"

#include <filesystem>

namespace {

class QmeditChange : public Qmedit {
protected:
    QmeditChange() : m_edit(imported(kShortList)) {}

    /// Runs a command that must succeed; its standard output.
    String done(std::vector<std::string> arguments) {
        const String what = arguments.front();
        const test::ProgramResult result = run(std::move(arguments));
        EXPECT_EQ(result.code, 0) << what << ": " << result.err;
        return result.out;
    }
    /// What the edit holds, without the time of its last change.
    nlohmann::json content() {
        nlohmann::json json = shown(m_edit);
        json.erase("modified");
        return json;
    }
    [[nodiscard]] std::string fileOf(const String& item) const {
        return project() + "/P0001000/" + item + ".qme";
    }

    String m_edit;
};

TEST_F(QmeditChange, EveryChangeCanBeUndoneAndRedone) {
    const std::vector<std::vector<std::string>> changes = {
        {"rename", m_edit, "Reel 2"},
        {"marker", "add", m_edit + "@10:00:02:00-10:00:03:00", "here", "--colour", "blue", "--attach"},
        {"marker", "move", m_edit + "@4s", "1"},
        {"marker", "remove", m_edit, "1"},
        {"apply", "lift", "--to", m_edit + "@1s-2s"},
        {"transition", "add", m_edit + "@3s", "--kind", "dissolve", "--length", "12f", "--align", "start"},
        {"transition", "set", m_edit + "@3.2s", "--kind", "wipe:1"},
        {"transition", "remove", m_edit + "@10:00:03:00"},
    };
    for (const std::vector<std::string>& change : changes) {
        SCOPED_TRACE(change[0] + " " + change[1]);
        const nlohmann::json before = content();
        if (change[0] == "transition") {
            std::vector<std::string> trial = change;
            trial.emplace_back("--dry-run");
            done(trial);
            EXPECT_EQ(content(), before);
        }
        done(change);
        const nlohmann::json after = content();
        EXPECT_NE(before, after);
        done({"undo", m_edit});
        EXPECT_EQ(content(), before);
        done({"redo", m_edit});
        EXPECT_EQ(content(), after);
    }
}

TEST_F(QmeditChange, UndoAndRedoNameTheChangeEachByACommandOfItsOwn) {
    done({"rename", m_edit, "Reel 2"});
    done({"marker", "add", m_edit + "@1s", "here"});
    const std::pair<const char*, const char*> steps[] = {{"undo", "undid 'cues'"}, {"undo", "undid 'name'"},
                                                         {"redo", "redid 'name'"}, {"redo", "redid 'cues'"},
                                                         {"undo", "undid 'cues'"}, {"undo", "undid 'name'"}};
    for (const auto& [step, told] : steps) {
        const String out = done({step, m_edit});
        EXPECT_NE(out.find(told), String::npos) << out;
    }
    const String history = done({"history", m_edit});
    EXPECT_EQ(history.find("undoing of cues"), String::npos) << history;
}

TEST_F(QmeditChange, MarkersGoWhereTheyArePut) {
    done({"marker", "add", m_edit + "@2s-3s", "span", "--attach"});
    done({"marker", "add", m_edit + "@12f", "moment", "--colour", "green"});
    done({"marker", "move", m_edit + "@6s", "3"}); // the span, behind a cut
    const nlohmann::json markers = nlohmann::json::parse(done({"marker", "list", m_edit, "--json"}));
    ASSERT_EQ(markers.size(), 3u);
    EXPECT_EQ(markers[0]["text"], "moment");
    EXPECT_EQ(markers[0]["time"], 12);
    EXPECT_EQ(markers[0]["colour"], "GREEN");
    EXPECT_EQ(markers[2]["number"], 3);
    EXPECT_EQ(markers[2]["time"], 150);
    EXPECT_EQ(markers[2]["length"], 25) << "it keeps its length";
    EXPECT_EQ(markers[2]["attached"], true);

    const auto before = snapshot();
    const std::pair<std::vector<std::string>, const char*> wrong[] = {
        {{"marker", "add", m_edit, "text"}, "needs a time"},
        {{"marker", "add", m_edit + "@1s", "text", "--colour", "grey"}, "'grey' is no colour"},
        {{"marker", "add", m_edit + "@20s", "text", "--attach"}, "no clip"},
        {{"marker", "move", m_edit + "@1s", "4"}, "no marker '4'"},
        {{"marker", "remove", m_edit, "0"}, "no marker '0'"},
    };
    for (const auto& [arguments, told] : wrong) {
        const test::ProgramResult result = run(arguments);
        EXPECT_NE(result.code, 0);
        EXPECT_NE(result.err.find(told), String::npos) << result.err;
    }
    EXPECT_EQ(snapshot(), before);
}

TEST_F(QmeditChange, PurgeTakesTheShotsThatNoStateOfAnEditPlays) {
    const std::string harbour = "E0001000";
    done({"apply", "lift", "--to", m_edit + "@0s-10s", "--channels", "V"});
    EXPECT_EQ(done({"purge"}), "") << "undo and the clipboard play it";
    done({"delete", "E00050HZ"});
    EXPECT_EQ(done({"purge"}), "");
    done({"delete", m_edit});
    const auto before = snapshot();
    const String listed = done({"purge", "--dry-run"});
    EXPECT_EQ(lines(listed), 2u) << listed;
    EXPECT_NE(listed.find(harbour + "  harbour"), String::npos) << listed;
    EXPECT_EQ(snapshot(), before);

    const String second = imported(kShortList, {"--new-shots"});
    std::filesystem::copy_file(fileOf(second), fileOf(second) + ".U1");
    std::filesystem::resize_file(fileOf(second) + ".U1", 3000);
    const test::ProgramResult refused = run({"purge"});
    EXPECT_EQ(refused.code, 1);
    EXPECT_NE(refused.err.find(second + ".qme.U1"), String::npos) << refused.err;
    EXPECT_NE(done({"purge", "--force"}).find("2 shots deleted"), String::npos);
    EXPECT_FALSE(std::filesystem::exists(fileOf(harbour)));
    done({"recover", harbour});
    EXPECT_EQ(done({"header", harbour, "NAME"}), "harbour\n");
}

TEST_F(QmeditChange, DeleteTellsWhatGoesAndRecoverBringsItBack) {
    done({"rename", m_edit, "Reel 2"});
    const nlohmann::json kept = content();
    done({"list"}); // brings the record up to date
    const auto before = snapshot();
    const test::ProgramResult trial = run({"delete", "reel 2", "--dry-run"});
    EXPECT_EQ(trial.code, 0);
    EXPECT_NE(trial.err.find(m_edit + ".qme.U1"), String::npos) << trial.err;
    EXPECT_EQ(snapshot(), before);
    done({"delete", "reel 2"});
    EXPECT_FALSE(std::filesystem::exists(fileOf(m_edit)));
    done({"recover", m_edit});
    EXPECT_EQ(content(), kept);
}

TEST_F(QmeditChange, NewMakesAnEditThatCanBeCutInto) {
    const String item = done({"new", "Reel 3", "--channels", "V1A4", "--rate", "24"}).trimmed();
    const nlohmann::json made = shown(item);
    EXPECT_EQ(made["name"], "Reel 3");
    EXPECT_EQ(made["rate"], 24);
    EXPECT_EQ(made["channels"].size(), 5u);
    done({"apply", "insert", "--from", m_edit + "@0s-2s", "--to", "Reel 3"});
    EXPECT_EQ(shown(item)["duration"], 48);
    const auto before = snapshot();
    EXPECT_EQ(run({"new", "x", "--channels", "A99"}).code, 1);
    EXPECT_EQ(run({"new", "x", "--channels", "B2"}).code, 2);
    EXPECT_EQ(snapshot(), before);
}

} // namespace
