#include "tests/tools/qmedit_fixture.h"

#include <chrono>
#include <filesystem>

namespace {

using nlohmann::json;

/// A pair as the list says it: record and source frames at 25 frames a second.
json pair(int in, int out, int stripIn, int stripOut, const json& name, const char* kind, double speed) {
    return {{"in", in},     {"out", out},   {"strip_in", stripIn}, {"strip_out", stripOut},
            {"name", name}, {"kind", kind}, {"speed", speed}};
}

json fieldsOf(const json& object, const std::vector<std::string>& keys) {
    json fields = json::object();
    for (const std::string& key : keys)
        fields[key] = object.at(key);
    return fields;
}

TEST_F(Qmedit, JsonHoldsEveryPairOfTheList) {
    const String item = imported(kShortList);
    const json edit = shown(item);
    EXPECT_EQ(edit.at("cookie"), item);
    EXPECT_TRUE(edit.at("rate").is_number_integer());
    EXPECT_EQ(edit.at("start"), 10 * 3600 * 25);
    EXPECT_EQ(edit.at("start_timecode"), "10:00:00:00");
    EXPECT_EQ(edit.at("duration"), 250);
    EXPECT_EQ(edit.at("duration_s"), 10.0);
    ASSERT_EQ(edit.at("channels").size(), 2u);
    const json& picture = edit.at("channels").at(0);
    EXPECT_EQ(fieldsOf(picture, {"name", "type", "subtype"}),
              (json{{"name", "V1"}, {"type", "V"}, {"subtype", "NONE"}}));
    EXPECT_EQ(edit.at("channels").at(1).at("type"), "A");

    const std::vector<json> expected = {
        pair(0, 75, 250, 325, "harbour", "shot", 1),
        pair(75, 100, 0, 25, nullptr, "black", 1),
        pair(125, 250, 500, 562, "harbour", "shot", 0.5),
        pair(0, 250, 1500, 1750, "gulls", "shot", 1),
    };
    std::vector<json> found;
    for (const json& channel : edit.at("channels"))
        for (const json& one : channel.at("pairs")) {
            found.push_back(fieldsOf(one, {"in", "out", "strip_in", "strip_out", "name", "kind", "speed"}));
            EXPECT_DOUBLE_EQ(one.at("out_s").get<double>() * 25, one.at("out").get<double>());
        }
    ASSERT_EQ(found.size(), expected.size());
    for (size_t i = 0; i < expected.size(); ++i) {
        if (expected[i].at("kind") == "black")
            found[i]["strip_in"] = 0, found[i]["strip_out"] = 25;
        // Half speed plays 62.5 frames, of which the list names whole ones.
        EXPECT_NEAR(found[i].at("strip_out"), expected[i].at("strip_out"), 1) << i;
        found[i]["strip_out"] = expected[i].at("strip_out");
        EXPECT_EQ(found[i], expected[i]);
    }
    ASSERT_EQ(edit.at("cues").size(), 1u);
    EXPECT_EQ(fieldsOf(edit.at("cues").at(0), {"time", "text", "colour"}),
              (json{{"time", 25}, {"text", "ship"}, {"colour", "RED"}}));
    EXPECT_TRUE(edit.at("groups").is_array());
}

TEST_F(Qmedit, HostileNamesDriveNeitherTerminalNorJson) {
    const std::string title = "evil\x1b[2J\x9b\xff\xe2\x80\xae\"\\";
    const String item = imported("TITLE: " + title +
                                 "\n001  R1 V C 00:00:00:00 00:00:02:00 00:00:00:00 00:00:02:00\n"
                                 "* FROM CLIP NAME: \x1b]0;owned\x07 caf\xc3\xa9\n");
    for (const std::vector<std::string>& arguments :
         {std::vector<std::string>{"show", item}, {"list"}, {"header", item}, {"header", item, "NAME"}}) {
        const test::ProgramResult result = run(arguments);
        ASSERT_EQ(result.code, 0) << result.err;
        for (const char* bad : {"\x1b", "\x07", "\x9b", "\xe2\x80\xae"})
            EXPECT_EQ((result.out + result.err).find(bad), std::string::npos) << arguments[0] << result.out;
        EXPECT_TRUE(Qx::isUtf8(result.out));
    }
    EXPECT_NE(run({"show", item}).out.find("caf\xc3\xa9"), String::npos);
    EXPECT_NE(run({"show", item}, {"LC_ALL=C"}).out.find("caf\\u{e9}"), String::npos);
    EXPECT_EQ(shown(item).at("channels").at(0).at("pairs").at(0).at("name"), "\x1b]0;owned\x07 caf\xc3\xa9");
}

TEST_F(Qmedit, MissingAndDamagedFilesAreSaidAndStopNothingElse) {
    namespace fs = std::filesystem;
    const String item = imported(kShortList);
    const json before = shown(item);
    const std::string strip = before.at("channels").at(0).at("pairs").at(0).at("strip");
    const std::string sound = before.at("channels").at(1).at("pairs").at(0).at("strip");
    const std::string edits = project() + "/P0001000/";
    fs::remove(edits + strip + ".qme");
    fs::resize_file(edits + sound + ".qme", fs::file_size(edits + sound + ".qme") / 2);
    folder.write("project/P0001000/notes.qme", "x");

    const json after = shown(item);
    for (const json& channel : after.at("channels")) {
        EXPECT_TRUE(channel.at("pairs").at(0).at("name").is_null());
        EXPECT_EQ(channel.at("pairs").at(0).at("missing"), true);
    }
    const test::ProgramResult picture = run({"show", item});
    EXPECT_EQ(picture.code, 0);
    EXPECT_NE(picture.out.find("missing " + strip), String::npos) << picture.out;
    EXPECT_EQ(lines(picture.err), 1u) << "one warning, not one a shot: " << picture.err;

    const test::ProgramResult list = run({"list", "--json"});
    EXPECT_EQ(list.code, 0);
    EXPECT_NE(list.err.find("notes.qme"), String::npos);
    const json listed = json::parse(list.out);
    ASSERT_EQ(listed.size(), 2u);
    for (const json& entry : listed)
        EXPECT_EQ(entry.at("damaged").is_string(), entry.at("cookie") == sound);
    EXPECT_NE(run({"list"}).out.find("damaged"), String::npos);

    const test::ProgramResult show = run({"show", sound});
    EXPECT_EQ(show.code, 1);
    EXPECT_EQ(lines(show.err), 1u);
    EXPECT_NE(show.err.find(sound + ".qme"), String::npos) << show.err;
    folder.write("project/P0001000/" + sound + ".qme.U1", "x");
    EXPECT_NE(run({"show", sound}).err.find(sound + ".qme.U1"), String::npos) << "the backup is named";
    EXPECT_NE(run({"show", "E0ZZZ000"}).err.find("qmedit list"), String::npos);
    EXPECT_NE(run({"header", item, "NO_KEY"}).err.find("qmedit header"), String::npos);

    folder.write("project/P0001000/Project.txt", "junk");
    const test::ProgramResult unsettled = run({"show", item});
    EXPECT_EQ(unsettled.code, 0) << "the edits can be looked at without the project's settings";
    EXPECT_NE(unsettled.err.find("Project.txt"), String::npos);
    const auto project = snapshot();
    EXPECT_EQ(run({"import", folder.write("again.edl", kShortList)}).code, 1);
    EXPECT_EQ(snapshot(), project);
}

TEST_F(Qmedit, TenThousandEventsAreShownAtOnce) {
    String list;
    for (int i = 0; i < 10000; ++i)
        list += String::format("%06d  R%03d V C 00:00:%02d:00 00:00:%02d:00 %02d:%02d:%02d:00 "
                               "%02d:%02d:%02d:00\n* FROM CLIP NAME: shot %d\n",
                               i + 1, i % 200, i % 50, i % 50 + 1, i / 3600, i / 60 % 60, i % 60,
                               (i + 1) / 3600, (i + 1) / 60 % 60, (i + 1) % 60, i % 200);
    const String item = imported(list);
    const auto start = std::chrono::steady_clock::now();
    const json edit = json::parse(run({"show", item, "--json"}).out);
    const auto taken = std::chrono::steady_clock::now() - start;
    EXPECT_EQ(edit.at("channels").at(0).at("pairs").size(), 10000u);
    EXPECT_EQ(edit.at("channels").at(0).at("pairs").at(9999).at("name"), "shot 199");
    // Wide of what it takes, for a busy machine and instrumented builds; a file read for each event would
    // take longer.
    EXPECT_LT(std::chrono::duration<double>(taken).count(), 10.0);
    EXPECT_LT(lines(run({"show", item}).out), 40u) << "the table is limited";
    EXPECT_GT(lines(run({"show", item, "--events"}).out), 10000u);
}

} // namespace
