#include "tests/tools/qmedit_fixture.h"

#include <filesystem>

namespace {

TEST_F(Qmedit, ImportListAndShowAgreeAcrossProcesses) {
    const test::ProgramResult result = run({"import", folder.write("short.edl", kShortList)});
    ASSERT_EQ(result.code, 0) << result.err;
    EXPECT_EQ(lines(result.out), 1u) << "the cookie alone, so that a script can take it";
    const String item = result.out.trimmed();

    const auto list = nlohmann::json::parse(run({"list", "--json"}).out);
    ASSERT_EQ(list.size(), 3u) << "two shots and the edit";
    const auto& entry = list.back();
    EXPECT_EQ(entry.at("cookie"), item);
    EXPECT_EQ(entry.at("type"), "edit");
    EXPECT_EQ(entry.at("name"), "Short");
    EXPECT_EQ(entry.at("rate"), 25);
    EXPECT_EQ(entry.at("duration"), 250);
    EXPECT_EQ(entry.at("channels"), 2);
    EXPECT_TRUE(entry.at("damaged").is_null());

    EXPECT_EQ(run({"header", item, "name"}).out, "Short\n");
    EXPECT_EQ(nlohmann::json::parse(run({"header", item, "FRAME_BASED", "--json"}).out),
              (nlohmann::json{{"FRAME_BASED", 1}}));
    EXPECT_EQ(shown(item).at("name"), "Short");
    EXPECT_EQ(run({"show", item.lower()}).code, 0) << "cookies are read in any case";
    const String inside = project() + "/P0001000";
    EXPECT_EQ(run({"list", "--project", inside}).out, run({"list"}).out)
        << "the project's own folder will do";
}

TEST_F(Qmedit, ReadingChangesNothing) {
    const String item = imported(kShortList);
    const auto before = snapshot();
    for (const std::vector<std::string>& arguments : {std::vector<std::string>{"list"},
                                                      {"list", "--json"},
                                                      {"show", item},
                                                      {"show", item, "--json"},
                                                      {"header", item}})
        EXPECT_EQ(run(arguments).code, 0);
    EXPECT_EQ(snapshot(), before);
}

TEST_F(Qmedit, RateOfTheFirstImportBecomesTheProjects) {
    const std::string list = "001  R1 V C 00:00:00:00 00:00:02:00 00:00:00:00 00:00:02:00\n";
    EXPECT_EQ(shown(imported(list, {"--rate", "24"})).at("rate"), 24);
    EXPECT_EQ(shown(imported(list)).at("rate"), 24) << "the project's, when none is given";
    const auto other = shown(imported(list, {"--rate", "29.97"}));
    EXPECT_DOUBLE_EQ(other.at("rate"), 29.97);
    EXPECT_EQ(other.at("rate_text"), "29.97");
    EXPECT_EQ(other.at("duration"), 60);
}

TEST_F(Qmedit, LossesGoToStandardErrorAndStrictRefusesThem) {
    const std::string list = "001  R1 V C        00:00:00:00 00:00:02:00 00:00:00:00 00:00:02:00\n"
                             "002  R2 NONE C     00:00:00:00 00:00:02:00 00:00:02:00 00:00:04:00\n";
    const String path = folder.write("trackless.edl", list);
    const test::ProgramResult strict = run({"import", path, "--strict"});
    EXPECT_EQ(strict.code, 1);
    EXPECT_TRUE(strict.out.empty());
    EXPECT_TRUE(snapshot().empty());
    const test::ProgramResult result = run({"import", path});
    EXPECT_EQ(result.code, 0);
    EXPECT_NE(result.err.find("trackless.edl:2: loss"), String::npos) << result.err;
    EXPECT_EQ(lines(result.out), 1u);
}

TEST_F(Qmedit, ManyListsGoThroughPipesAndScripts) {
    const String good = folder.write("good.edl", kShortList);
    const String bad =
        folder.write("bad.edl", "001  R7 V C\n002  R7 V\n"
                                "003  R7 V C 00:00:00:00 00:00:02:00 00:00:00:00 00:00:02:00\n");
    const test::ProgramResult several = run({"import", good, bad, good});
    EXPECT_EQ(several.code, 1);
    EXPECT_EQ(several.out, "E0003000\nE0004000\n")
        << "the shots of the first are played again: " << several.err;
    for (const char* told :
         {"bad.edl:1: error", "bad.edl:2: error", "--skip-bad", "2 shots of the project"}) {
        EXPECT_NE(several.err.find(told), String::npos) << told << several.err;
    }
    const auto json =
        nlohmann::json::parse(run({"import", bad, good, "--json", "--skip-bad", "--new-shots"}).out);
    EXPECT_EQ(json.at(0).at("losses").size(), 2u);
    EXPECT_EQ(json.at(0).at("losses").at(1).at("line"), 2);
    EXPECT_EQ(json.at(1).at("shots"), 2);
    const auto refused = nlohmann::json::parse(run({"import", bad, "--json"}).out);
    EXPECT_EQ(refused.at(0).at("errors").size(), 2u);
    EXPECT_TRUE(refused.at(0).at("cookie").is_null());

    const test::ProgramResult exported = run({"export", "E0003000", "-"});
    const test::ProgramResult piped = runOn(folder.write("list", exported.out), {"import", "-"});
    ASSERT_EQ(piped.code, 0) << piped.err;
    EXPECT_EQ(run({"export", piped.out.trimmed(), "-"}).out, exported.out);
    EXPECT_EQ(runOn(folder.write("letter", "Dear editor,\n"), {"import", "-"}).code, 1);

    const test::ProgramResult all =
        run({"export", "E0003000", "E0004000", "--into", folder.path(), "--json"});
    EXPECT_EQ(nlohmann::json::parse(all.out).at(1).at("file"), folder.path("E0004000.edl"));
    EXPECT_TRUE(std::filesystem::exists(folder.path("E0003000.edl").c_str()));
    EXPECT_EQ(run({"export", "E0003000", "-", "--json"}).code, 2);
}

TEST_F(Qmedit, BadFilesFailInOneLineAndLeaveTheProjectAsItWas) {
    namespace fs = std::filesystem;
    const String folderPath = folder.path("folder.edl");
    fs::create_directory(fs::path(folderPath.c_str()));
    const String zeros = folder.write("zeros.edl", "");
    fs::resize_file(fs::path(zeros.c_str()), 200u << 20);
    fs::create_symlink("nowhere", fs::path(folder.path("link.edl").c_str()));
    const std::string jpeg = std::string("\xFF\xD8\xFF\xE0\0\x10JFIF\0", 12);
    const std::string event = "001  R1 V C 00:00:00:00 00:00:01:00 99:99:99:99 01:00:01:00\n";
    const std::string badByte = "TITLE: x\n001  R1 V C 00:00:00:00 00:00:01:00 01:00:00:00 01:00\x1b[2J\n";
    const std::vector<std::pair<String, const char*>> files = {
        {folder.path("missing.edl"), "missing.edl: there is no such file"},
        {folderPath, "folder.edl: this is a folder"},
        {folder.path("link.edl"), "link.edl"},
        {folder.write("empty.edl", ""), "empty.edl:1: "},
        {folder.write("title.edl", "TITLE: nothing else\n"), "title.edl:1: "},
        {zeros, "zeros.edl:1: "},
        {folder.write("photo.jpg", jpeg), "photo.jpg:1: "},
        {folder.write("photo.edl", jpeg), "photo.edl:1: "},
        {folder.write("letter.txt", "Dear editor,\n"), "letter.txt:1: "},
        {folder.write("label.edl", "TITLE: x\n" + event), "label.edl:2: "},
        {folder.write("hostile.edl", badByte), "hostile.edl:2: "},
        {folder.write("E0001000.qme", "x"), "'qmedit show COOKIE"},
        {"/dev/zero", "/dev/zero: not a regular file"},
    };
    for (const bool withProject : {false, true}) {
        if (withProject)
            imported(kShortList);
        const auto before = snapshot();
        for (const auto& [path, error] : files) {
            SCOPED_TRACE(path);
            const test::ProgramResult result = run({"import", path});
            EXPECT_EQ(result.code, 1);
            EXPECT_TRUE(result.out.empty());
            EXPECT_EQ(lines(result.err), 1u) << result.err;
            EXPECT_NE(result.err.find(error), String::npos) << result.err;
            EXPECT_EQ(result.err.find('\x1b'), String::npos) << "the file's bytes do not reach the terminal";
            EXPECT_EQ(snapshot(), before);
        }
    }
}

TEST_F(Qmedit, DemoMakesAProjectThatStaysAndNamesIt) {
    const test::ProgramResult result = run({"demo"});
    ASSERT_EQ(result.code, 0) << result.err;
    const size_t at = result.out.find("show E");
    ASSERT_NE(at, String::npos);
    const String kept = folder.path() + "/quillmarch-demo-";
    const size_t named = result.out.find(kept, result.out.find("The project is kept in "));
    ASSERT_NE(named, String::npos) << result.out;
    for (const char* said : {"apply replace", "undid 'effects'", "redid 'effects'", "2 to undo, 0 to redo"}) {
        EXPECT_NE(result.out.find(said), String::npos) << said;
    }
    const String made = result.out.substr(named, result.out.find_first_of(" .\n", named) - named);
    const auto edit =
        nlohmann::json::parse(run({"show", result.out.substr(at + 5, 8), "--json", "--project", made}).out);
    ASSERT_EQ(edit.at("channels").size(), 3u);
    EXPECT_EQ(edit.at("name"), "MARKET DAY");
    EXPECT_EQ(edit.at("duration"), 52 * 25);
    EXPECT_EQ(edit.at("cues").size(), 3u);
    const auto& picture = edit.at("channels").at(0).at("pairs");
    ASSERT_EQ(picture.size(), 17u);
    EXPECT_EQ(picture.at(5).at("transition"), "dissolve");
    EXPECT_EQ(picture.at(13).at("name"), "last customers");
    EXPECT_EQ(picture.at(14).at("transition"), "wipe 1");
    EXPECT_TRUE(std::filesystem::exists((made + "/market_day_recut.edl").c_str()));
}

} // namespace
