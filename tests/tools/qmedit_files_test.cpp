#include "tests/tools/qmedit_fixture.h"

#include <filesystem>
#include <sys/stat.h>

namespace fs = std::filesystem;

namespace {

class QmeditFiles : public Qmedit {
protected:
    [[nodiscard]] fs::path projectFolder() const { return fs::path(project().c_str()) / "P0001000"; }
    [[nodiscard]] fs::path fileOf(const String& item) const {
        return projectFolder() / (item + ".qme").c_str();
    }

    static std::string bytesOf(const fs::path& path) {
        std::ifstream file(path, std::ios::binary);
        return {std::istreambuf_iterator<char>(file), {}};
    }
    static void put(const fs::path& path, const std::string& bytes) {
        fs::create_directories(path.parent_path());
        std::ofstream(path, std::ios::binary) << bytes;
    }
    /// Changes one byte of a file, right before the end of the text `mark` in it.
    static void damage(const fs::path& path, const std::string& mark) {
        std::string bytes = bytesOf(path);
        const size_t at = bytes.find(mark);
        ASSERT_NE(at, std::string::npos);
        bytes[at + mark.size() - 1] ^= 0x01;
        put(path, bytes);
    }
};

TEST_F(QmeditFiles, ExportGivesAnImportedListBack) {
    const std::string list = "TITLE: Short\n"
                             "FCM: NON-DROP FRAME\n"
                             "001  R1       B     C        00:00:10:00 00:00:13:00 10:00:00:00 10:00:03:00\n"
                             "* FROM CLIP NAME: harbour\n"
                             "* LOC: 10:00:01:00 RED     ship\n"
                             "002  R2       V     C        00:00:10:00 00:00:12:00 10:00:03:00 10:00:07:00\n"
                             "M2   R2             012.5                00:00:10:00\n";
    const String item = imported(list);
    const auto before = snapshot();
    const String out = folder.path("out.edl");
    const test::ProgramResult result = run({"export", item, out, "--strict"});
    EXPECT_EQ(result.code, 0) << result.err;
    EXPECT_TRUE(result.out.empty() && result.err.empty()) << result.err;
    EXPECT_EQ(folder.read("out.edl"), list);
    EXPECT_EQ(run({"export", item, folder.path("dos.EDL"), "--crlf"}).code, 0);
    EXPECT_NE(folder.read("dos.EDL").find("TITLE: Short\r\nFCM:"), std::string::npos);
    EXPECT_EQ(snapshot(), before) << "the project is as it was";
}

TEST_F(QmeditFiles, LegacyTextGoesOutAndIn) {
    const String item = imported(kShortList);
    const String text = folder.path("reel.ed2");
    ASSERT_EQ(run({"export", item, text}).code, 0);
    const test::ProgramResult again = run({"import", text});
    ASSERT_EQ(again.code, 0) << again.err;
    const String copy = again.out.trimmed();
    EXPECT_NE(copy, item) << "an edit of its own";
    auto before = shown(item);
    auto after = shown(copy);
    for (auto* json : {&before, &after}) {
        json->erase("cookie");
        json->erase("modified");
    }
    EXPECT_EQ(after.at("channels"), before.at("channels"));
    EXPECT_EQ(after.at("cues"), before.at("cues"));
    EXPECT_EQ(after.at("name"), before.at("name"));

    // The name of a shot's item in the text changes nothing; a fresh project takes the text's rate.
    const test::ProgramResult other = run({"import", text, "--project", folder.path("other")});
    EXPECT_EQ(other.code, 0) << other.err;
    // No edit that is made there, at once or later, is one that the text names as a source.
    ASSERT_EQ(run({"import", folder.path("list.edl"), "--project", folder.path("other")}).code, 0);
    size_t edits = 0;
    for (const auto& [name, bytes] : test::treeSnapshot(folder.path("other"))) {
        if (name.ends_with(".qme")) {
            ++edits;
            EXPECT_EQ(folder.read("reel.ed2").find(" STRIP " + name.substr(0, name.size() - 4)),
                      std::string::npos)
                << name;
        }
    }
    EXPECT_GT(edits, 2u);
    EXPECT_EQ(run({"import", text, "--rate", "24"}).code, 1) << "the text states its rate";
}

TEST_F(QmeditFiles, ABadLegacyTextNamesFileAndLine) {
    const String item = imported(kShortList);
    const String text = folder.path("reel.ed2");
    ASSERT_EQ(run({"export", item, text}).code, 0);
    std::string bytes = folder.read("reel.ed2");
    const size_t channel = bytes.find('\n', bytes.find("CHANNEL_NAME "));
    const size_t second = bytes.find('\n', bytes.find('\n', channel + 1) + 1);
    bytes.insert(second + 1, "no event of any kind\n");
    const auto before = snapshot();
    const test::ProgramResult result = run({"import", folder.write("bad.ed2", bytes)});
    EXPECT_EQ(result.code, 1);
    EXPECT_EQ(lines(result.err), 1u) << result.err;
    EXPECT_NE(result.err.find("bad.ed2"), String::npos) << result.err;
    EXPECT_NE(result.err.find("line "), String::npos) << result.err;
    EXPECT_EQ(run({"import", folder.write("empty.ed2", "")}).code, 1);
    EXPECT_EQ(snapshot(), before);
}

TEST_F(QmeditFiles, ExportRefusesTargetsThatAreNoFiles) {
    const String item = imported(kShortList);
    const String real = folder.write("real.edl", "old");
    for (const char* const form : {".edl", ".ed2"}) {
        const std::string end = form;
        fs::create_symlink(real.c_str(), folder.path("link" + end).c_str());
        fs::create_directory(folder.path("folder" + end).c_str());
        ASSERT_EQ(::mkfifo(folder.path("pipe" + end).c_str(), 0600), 0);
        for (const char* const name : {"link", "folder", "pipe"}) {
            const test::ProgramResult result = run({"export", item, folder.path(name + end)});
            EXPECT_EQ(result.code, 1) << name << end;
            EXPECT_EQ(lines(result.err), 1u) << result.err;
        }
        EXPECT_TRUE(fs::is_symlink(folder.path("link" + end).c_str()));
    }
    EXPECT_EQ(folder.read("real.edl"), "old");
    EXPECT_EQ(run({"export", item, folder.path("x.txt")}).code, 2);
}

TEST_F(QmeditFiles, TextsThatAreNoCookiesNameNoPath) {
    imported(kShortList);
    fs::copy_file(fileOf("E0001000"), folder.path("E0001000.qme").c_str());
    const auto before = snapshot();
    for (const char* const text : {"../../x", "../E0001000", "/etc/passwd", "E0001000.qme", "E000/000", ""}) {
        EXPECT_EQ(run({"export", text, folder.path("out.edl")}).code, 1) << text;
        EXPECT_EQ(run({"verify", text}).code, 1) << text;
    }
    EXPECT_FALSE(fs::exists(folder.path("out.edl").c_str()));
    EXPECT_EQ(snapshot(), before);
}

TEST_F(QmeditFiles, VerifyLooksAtEditsBackupsAndMilestones) {
    const String item = imported(kShortList);
    const std::string whole = bytesOf(fileOf(item));
    put(projectFolder() / (item + ".qme.U1").c_str(), whole);
    put(projectFolder() / (item + ".qme.R2").c_str(), whole.substr(0, whole.size() / 2));
    put(projectFolder() / "Milestones" / item.c_str() / (item + ".7").c_str(), whole);
    put(projectFolder() / "Milestones" / item.c_str() / (item + ".8").c_str(), "x");
    put(projectFolder() / "notes.txt", "no edit");
    const auto before = snapshot();
    test::ProgramResult result = run({"verify", "--json"});
    EXPECT_EQ(result.code, 1);
    std::map<std::string, bool> sound;
    for (const auto& file : nlohmann::json::parse(result.out)) {
        sound[file.at("file")] = file.at("sound");
        EXPECT_EQ(file.at("sound").get<bool>(), file.at("faults").empty());
    }
    const std::string name = item;
    EXPECT_EQ(sound, (std::map<std::string, bool>{{"E0001000.qme", true},
                                                  {"E0002000.qme", true},
                                                  {name + ".qme", true},
                                                  {name + ".qme.U1", true},
                                                  {name + ".qme.R2", false},
                                                  {"Milestones/" + name + "/" + name + ".7", true},
                                                  {"Milestones/" + name + "/" + name + ".8", false}}));
    result = run({"verify"});
    EXPECT_EQ(result.code, 1);
    EXPECT_EQ(lines(result.out), 8u) << "one line a file and the sum\n" << result.out;
    EXPECT_EQ(run({"verify", "E0001000", "E0002000"}).code, 0);
    EXPECT_EQ(run({"verify", "E000Z000"}).code, 1) << "there is none";
    EXPECT_EQ(snapshot(), before);

    fs::remove_all(projectFolder() / "Milestones");
    fs::remove(projectFolder() / (item + ".qme.R2").c_str());
    EXPECT_EQ(run({"verify"}).code, 0);
    // What is no file of its own is not followed.
    fs::create_symlink(fileOf(item), projectFolder() / "E0009000.qme");
    fs::create_directory_symlink(folder.path().c_str(), projectFolder() / "Milestones");
    ASSERT_EQ(::mkfifo((projectFolder() / "E000B000.qme").c_str(), 0600), 0);
    result = run({"verify"});
    EXPECT_EQ(result.code, 1);
    EXPECT_NE(result.out.find("E0009000.qme  NOT SOUND: "), String::npos) << result.out;
    EXPECT_NE(result.out.find("E000B000.qme  NOT SOUND: "), String::npos) << result.out;
    EXPECT_EQ(lines(result.out), 7u) << result.out;
}

TEST_F(QmeditFiles, SalvageSavesTheRestInAProjectOfItsOwn) {
    const String item = imported(kShortList);
    damage(fileOf(item), "EDL_EVENTS");
    const std::string damaged = bytesOf(fileOf(item));
    EXPECT_EQ(run({"show", item}).code, 1);
    EXPECT_EQ(run({"verify", item}).code, 1);
    const auto before = snapshot();

    const String rescue = folder.path("rescue");
    test::ProgramResult result = run({"salvage", fileOf(item).string(), "--into", rescue});
    ASSERT_EQ(result.code, 0) << result.err;
    EXPECT_EQ(lines(result.out), 1u) << result.out;
    EXPECT_EQ(result.err.find("lost: the header: "), 0u) << result.err;
    EXPECT_EQ(snapshot(), before);
    EXPECT_EQ(bytesOf(fileOf(item)), damaged);
    const String saved = result.out.trimmed();
    EXPECT_EQ(run({"verify", "--project", rescue}).code, 0);
    const auto edit = nlohmann::json::parse(run({"show", saved, "--json", "--project", rescue}).out);
    ASSERT_EQ(edit.at("channels").size(), 2u);
    EXPECT_EQ(edit.at("channels").at(0).at("pairs").size(), 3u);
    EXPECT_EQ(edit.at("cues").size(), 1u);

    result = run({"salvage", fileOf(item).string(), "--into", rescue, "--json"});
    ASSERT_EQ(result.code, 0) << result.err;
    const auto json = nlohmann::json::parse(result.out);
    EXPECT_NE(json.at("cookie"), std::string(saved)) << "nothing is replaced";
    EXPECT_EQ(json.at("channels"), 2);
    EXPECT_EQ(json.at("lost").size(), 1u);
}

TEST_F(QmeditFiles, WhatCannotBeSalvagedMakesNoProject) {
    const String item = imported(kShortList);
    fs::create_symlink(fileOf(item), folder.path("link.qme").c_str());
    const String rescue = folder.path("rescue");
    for (const String& file : {folder.path("link.qme"), folder.path("none.qme"), folder.path(),
                               folder.write("list.qme", kShortList), folder.write("cut.qme", "\x89QME")}) {
        const test::ProgramResult result = run({"salvage", file, "--into", rescue});
        EXPECT_EQ(result.code, 1) << file;
        EXPECT_EQ(lines(result.err), 1u) << result.err;
    }
    EXPECT_FALSE(fs::exists(rescue.c_str()));
    EXPECT_EQ(run({"salvage", "x.qme"}).code, 2) << "--into is required";
}

} // namespace
