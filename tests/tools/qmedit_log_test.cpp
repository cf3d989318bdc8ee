#include "qmedit_fixture.h"

using QmeditLog = Qmedit;

TEST_F(QmeditLog, IsShownSetFoundAndTakenBack) {
    const String item = imported(kShortList);
    EXPECT_EQ(run({"flush"}).code, 0);
    const auto before = snapshot();
    const struct {
        std::vector<std::string> set;
        int code;
        const char* says;
    } refused[] = {{{"scene"}, 2, "sets no attribute"},
                   {{"scene=1", "date=2"}, 2, "sets no attribute"},
                   {{"scene=1", "reel=a\nb"}, 1, "nothing was changed"}};
    for (const auto& c : refused) {
        std::vector<std::string> arguments{"log", item, "--set"};
        arguments.insert(arguments.end(), c.set.begin(), c.set.end());
        const test::ProgramResult result = run(arguments);
        EXPECT_EQ(result.code, c.code);
        EXPECT_NE(result.err.find(c.says), String::npos) << result.err;
        EXPECT_EQ(snapshot(), before);
    }
    EXPECT_EQ(run({"log", item, "--set", "scene=12A", "24p_reel=R 1", "name=Harbour"}).code, 0);
    const auto log = nlohmann::json::parse(run({"log", item, "--json"}).out);
    EXPECT_EQ(log["scene"], "12A");
    EXPECT_EQ(log["24P reel"], "R 1");
    EXPECT_EQ(log["name"], "Harbour");
    EXPECT_EQ(log["Type"], "edit");
    EXPECT_EQ(lines(run({"log", item}).out), log.size() + 1);

    const auto found = nlohmann::json::parse(run({"find", "Scene=12*", "name=harb*", "--json"}).out);
    ASSERT_EQ(found.size(), 1U);
    EXPECT_EQ(found[0]["cookie"], item);
    EXPECT_EQ(found[0]["24P reel"], "R 1");
    EXPECT_EQ(lines(run({"find", "type=shot"}).out), 3U) << "a heading and two shots";
    EXPECT_EQ(lines(run({"find", "reel=r1", "type=shot"}).out), 2U) << "the reel came with the import";
    EXPECT_EQ(run({"find", "nothing=1"}).code, 2);
    EXPECT_EQ(run({"undo", item}).code, 0);
    EXPECT_EQ(lines(run({"find", "scene=12A"}).out), 1U);
}

TEST_F(QmeditLog, ACurrentProjectNeedsNoUpgrade) {
    const String item = imported(kShortList);
    const auto before = snapshot();
    const test::ProgramResult all = run({"upgrade"});
    EXPECT_EQ(all.code, 0) << all.err;
    EXPECT_EQ(all.out, "3 edits: 0 upgraded, 3 current, 0 not upgraded\n");
    const auto json = nlohmann::json::parse(run({"upgrade", item, "--dry-run", "--json"}).out);
    EXPECT_EQ(json[0]["outcome"], "current");
    EXPECT_EQ(snapshot(), before);
    EXPECT_EQ(run({"upgrade", "E0ZZ0000"}).code, 1);
    EXPECT_EQ(run({"upgrade", "no such name"}).code, 1);
}

TEST_F(QmeditLog, LabelsStandBesideTheEvents) {
    const String item = imported(kShortList);
    const auto pairs = nlohmann::json::parse(
        run({"show", item, "--json", "--label", "Primary_Timecode", "Edit_Timecode"}).out);
    ASSERT_EQ(pairs.size(), 4U);
    EXPECT_EQ(pairs[0]["labels"]["Primary_Timecode"], (nlohmann::json{"00:00:10:00", "00:00:13:00"}));
    EXPECT_EQ(pairs[2]["labels"]["Primary_Timecode"], (nlohmann::json{"00:00:20:00", "00:00:22:12"}));
    EXPECT_EQ(pairs[2]["labels"]["Edit_Timecode"], (nlohmann::json{"10:00:05:00", "10:00:10:00"}));
    const test::ProgramResult table = run({"show", item, "--label", "KeyKode"});
    EXPECT_EQ(lines(table.out), 5U) << table.out;
    const auto burnt = nlohmann::json::parse(run({"show", item, "--burnin", "10:00:06:00", "--json"}).out);
    EXPECT_EQ(burnt["labels"]["Primary_Timecode"], "00:00:20:12") << "at half speed";
    EXPECT_EQ(burnt["labels"]["name"], "Short");
    EXPECT_EQ(run({"show", item, "--label", "nothing"}).code, 2);
    EXPECT_EQ(run({"show", item, "--burnin", "10:00"}).code, 2);
}
