#include "tests/tools/qmedit_fixture.h"

namespace {

struct Usage {
    std::vector<std::string> arguments;
    int code;
    const char* error; ///< a part of the one line on standard error; null for none
};

TEST_F(Qmedit, AnswersEveryUsageWithItsExitCodeAndStream) {
    const std::vector<Usage> usages = {
        {{"--help"}, 0, nullptr},
        {{"--version"}, 0, nullptr},
        {{"import", "--help"}, 0, nullptr},
        {{"list", "--help"}, 0, nullptr},
        {{"show", "-h"}, 0, nullptr},
        {{"header", "--help"}, 0, nullptr},
        {{"demo", "--help"}, 0, nullptr},
        {{"completion", "bash"}, 0, nullptr},
        {{}, 2, "name a command"},
        {{"no-such-command"}, 2, "no-such-command"},
        {{"--no-such-option"}, 2, "--no-such-option"},
        {{"list", "--rate", "25"}, 2, "qmedit list --help"},
        {{"import"}, 2, "FILE"},
        {{"import", "a.edl", "--strict", "--skip-bad"}, 2, "--skip-bad"},
        {{"show", "E0001000", "--width", "29"}, 2, "30"},
        {{"show", "E0001000", "--colour", "red"}, 2, "red"},
        {{"export", "E0001000"}, 2, "--into"},
        {{"import", "a.edl", "--rate", "26"}, 2, "26"},
        {{"import", "a.edl", "--project", ""}, 2, "--project"},
        {{"show"}, 2, "COOKIE"},
        {{"show", "E000100"}, 2, "E000100"},
        {{"show", "../E0001000"}, 2, "no cookie"},
        {{"show", "E0001000", "--json", "--events"}, 2, "--events"},
        {{"header", "?"}, 2, "no cookie"},
        {{"completion", "csh"}, 2, "csh"},
        {{"list"}, 1, "no project"},
        {{"show", "E0001000"}, 1, "no project"},
        {{"header", "E0001000"}, 1, "no project"},
        {{"undo"}, 2, "COOKIE"},
        {{"backup", "../E0001000"}, 2, "no cookie"},
        {{"recover", "E0001000", "--from"}, 2, "--from"},
        {{"history", "E0001000"}, 1, "no project"},
        {{"backup", "E0001000"}, 1, "no project"},
        {{"undo", "E0001000"}, 1, "no project"},
        {{"redo", "E0001000"}, 1, "no project"},
        {{"recover", "E0001000"}, 1, "no project"},
        {{"delete", "E0001000"}, 1, "no project"},
        {{"flush"}, 1, "no project"},
    };
    for (const Usage& usage : usages) {
        String shown;
        for (const std::string& argument : usage.arguments)
            shown += " " + argument;
        SCOPED_TRACE("qmedit" + shown);
        const test::ProgramResult result = run(usage.arguments);
        EXPECT_EQ(result.code, usage.code);
        EXPECT_EQ(result.out.empty(), usage.code != 0) << result.out;
        EXPECT_EQ(lines(result.err), usage.error == nullptr ? 0u : 1u) << result.err;
        EXPECT_NE(result.err.find(usage.error == nullptr ? "" : usage.error), String::npos) << result.err;
        EXPECT_TRUE(snapshot().empty()) << "no command but a good import makes a project";
    }
}

TEST_F(Qmedit, HelpOfEachCommandHasAnExampleOfIt) {
    for (const std::string command :
         {"import", "export", "list", "show", "header", "apply", "diff", "verify", "salvage", "history",
          "backup", "undo", "redo", "recover", "delete", "flush", "demo", "completion"}) {
        const String help = run({command, "--help"}).out;
        const size_t example = help.find("Example:");
        ASSERT_NE(example, String::npos) << command;
        EXPECT_NE(help.find("qmedit " + command, example), String::npos) << command;
    }
}

TEST_F(Qmedit, SaysSoWhenStandardOutputIsFull) {
    imported(kShortList);
    const test::ProgramResult result = run({"list"}, {}, "/dev/full");
    EXPECT_EQ(result.code, 1);
    EXPECT_NE(result.err.find("standard output"), String::npos) << result.err;
}

TEST_F(Qmedit, CompletesCommandsOptionsAndCookiesInBash) {
    const String item = imported(kShortList);
    const String script = folder.write("completion.bash", run({"completion", "bash"}).out);
    const auto completed = [&](const std::string& words, int count) {
        const std::string commands = "source " + script + "; COMP_WORDS=(" + words +
                                     "); COMP_CWORD=" + std::to_string(count) +
                                     "; _qmedit; echo ${COMPREPLY[@]}";
        const auto result = test::runProgram("/bin/bash", {"--norc", "-c", commands},
                                             {{"QMEDIT_PROJECT=" + project(), "PATH=/usr/bin:/bin"}, {}});
        EXPECT_EQ(result.err, "");
        return result.out.trimmed();
    };
    const std::string program = QMEDIT_PROGRAM;
    EXPECT_EQ(completed(program + " sh", 1), "show");
    EXPECT_EQ(completed(program + " import --str", 2), "--strict");
    EXPECT_EQ(completed(program + " show ''", 2).find("E0001000"), 0u);
    EXPECT_EQ(completed(program + " header " + item, 2), item);
    EXPECT_EQ(completed(program + " import x --rate 29", 4), "29.97");
    EXPECT_EQ(completed(program + " undo " + item, 2), item);
    run({"backup", item});
    EXPECT_EQ(completed(program + " recover " + item + " --from u", 4), "U1");
}

} // namespace
