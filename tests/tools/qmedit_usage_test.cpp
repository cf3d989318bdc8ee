#include "tests/tools/qmedit_fixture.h"
#include "tools/qmedit/safe_text.h"

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
        {{"help"}, 0, nullptr},
        {{"help", "marker", "add"}, 0, nullptr},
        {{"no-such-command"}, 2, "no-such-command"},
        {{"shwo"}, 2, "there is no command 'shwo'; did you mean 'show'?"},
        {{"help", "shwo"}, 2, "did you mean 'show'?"},
        {{"marker"}, 2, "qmedit help marker"},
        {{"marker", "romove"}, 2, "did you mean 'remove'?"},
        {{"show", "x", "--jsno"}, 2, "has no option --jsno; did you mean '--json'?"},
        {{"apply", "repalce", "--to", "x"}, 2, "did you mean 'Replace'?"},
        {{"new", ""}, 2, "NAME"},
        {{"rename", "x", "a\nb"}, 2, "control characters"},
        {{"--no-such-option"}, 2, "--no-such-option"},
        {{"list", "--rate", "25"}, 2, "qmedit help list"},
        {{"import"}, 2, "FILE"},
        {{"import", "a.edl", "--strict", "--skip-bad"}, 2, "--skip-bad"},
        {{"show", "E0001000", "--width", "29"}, 2, "30"},
        {{"show", "E0001000", "--colour", "red"}, 2, "red"},
        {{"export", "E0001000"}, 2, "--into"},
        {{"import", "a.edl", "--rate", "26"}, 2, "26"},
        {{"import", "a.edl", "--project", ""}, 2, "--project"},
        {{"show"}, 2, "COOKIE"},
        {{"show", "E0001000", "--json", "--events"}, 2, "--events"},
        {{"completion", "csh"}, 2, "csh"},
        {{"list"}, 1, "no project"},
        {{"show", "E0001000"}, 1, "no project"},
        {{"header", "E0001000"}, 1, "no project"},
        {{"undo"}, 2, "COOKIE"},
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

TEST(SafeText, WrapsAtBlanksAndNeverInsideAWord) {
    EXPECT_EQ(safe_text::wrapped("one two three", 8, 0, 2), "one two\n  three");
    EXPECT_EQ(safe_text::wrapped("one two", 8, 5, 5), "one\n     two") << "five columns were taken";
    EXPECT_EQ(safe_text::wrapped("a muchtoolongword b", 8, 0, 1), "a\n muchtoolongword\n b");
    EXPECT_EQ(safe_text::wrapped("é é é é", 7, 0, 0), "é é é é") << "columns count, not bytes";
    EXPECT_EQ(safe_text::wrapped("", 7, 0, 0), "");
}

TEST_F(Qmedit, HelpOfEachCommandHasAnExampleOfIt) {
    std::vector<String> commands;
    for (const String& line : run({"--complete", ""}).out.split('\n', true)) {
        commands.push_back(line.substr(0, line.find('\t')));
    }
    ASSERT_GT(commands.size(), 20u);
    for (const String& command : commands) {
        const String help = run({command, "--help"}).out;
        const size_t example = help.find("Example:");
        ASSERT_NE(example, String::npos) << command;
        EXPECT_NE(help.find("qmedit " + command, example), String::npos) << command;
    }
}

TEST_F(Qmedit, ANameStandsForACookieWhereOneIsAskedFor) {
    const String item = imported(kShortList);
    const String shown = run({"show", item}).out;
    EXPECT_EQ(run({"show", "Short"}).out, shown);
    EXPECT_EQ(run({"show", "sHORT"}).out, shown) << "in any case";
    EXPECT_EQ(run({"header", "gulls", "NAME"}).out, "gulls\n") << "a shot";
    EXPECT_EQ(run({"apply", "lift", "--dry-run", "--to", "Short@1s-2s"}).code, 0);
    EXPECT_EQ(run({"backup", "short"}).code, 0);
    EXPECT_EQ(run({"diff", "Short.u1", "Short"}).out, "the same\n");

    const test::ProgramResult misspelt = run({"show", "Shrot"});
    EXPECT_EQ(misspelt.code, 1);
    EXPECT_NE(misspelt.err.find("did you mean 'Short'?"), String::npos) << misspelt.err;
    const String second = imported(kShortList);
    const test::ProgramResult several = run({"show", "Short"});
    EXPECT_EQ(several.code, 1);
    EXPECT_NE(several.err.find(item + ", " + second), String::npos) << several.err;
}

TEST_F(Qmedit, SaysSoWhenStandardOutputIsFull) {
    imported(kShortList);
    const test::ProgramResult result = run({"list"}, {}, "/dev/full");
    EXPECT_EQ(result.code, 1);
    EXPECT_NE(result.err.find("standard output"), String::npos) << result.err;
}

TEST_F(Qmedit, CompletesFromTheCommandsAndTheProject) {
    const String item = imported(kShortList);
    run({"backup", item});
    const auto answered = [&](std::vector<std::string> words) {
        words.insert(words.begin(), "--complete");
        const test::ProgramResult result = run(std::move(words));
        EXPECT_EQ(result.code, 0);
        String all;
        for (const String& line : result.out.split('\n', true)) {
            all += (all.empty() ? "" : " ") + String(line.substr(0, line.find('\t')));
        }
        return all;
    };
    const std::vector<std::pair<std::vector<std::string>, String>> cases = {
        {{"sh"}, "show"},
        {{"marker", "re"}, "remove"},
        {{"import", "--str"}, "--strict"},
        {{"import", ""}, ":files"},
        {{"list", "--project", ""}, ":folders"},
        {{"import", "x", "--rate", "29"}, "29.97"},
        {{"show", "sho"}, "Short"},
        {{"show", "--json", "gul"}, "gulls"},
        {{"show", item, ""}, ""},
        {{"verify", item, item.lower()}, item},
        {{"header", "Short", "frame_r"}, "FRAME_RATE"},
        {{"recover", item, "--from", "u"}, "U1"},
        {{"recover", "--from", "U1", item}, item},
        {{"apply", "replace-m"}, "replace-marked replace-material"},
        {{"marker", "add", item + "@1s", "text", "--colour", "r"}, "RED"},
        {{"completion", ""}, "bash zsh fish"},
        {{"no-such-command", ""}, ""},
    };
    for (const auto& [words, expected] : cases) {
        EXPECT_EQ(answered(words), expected) << words.front() << " ... " << words.back();
    }
}

TEST_F(Qmedit, TheShellsHandTheirWordsToTheCompletion) {
    const String item = imported(kShortList);
    run({"rename", item, "Market Day"});
    const String script = folder.write("completion.bash", run({"completion", "bash"}).out);
    const auto completed = [&](const std::string& words, int count) {
        const std::string commands = "source " + script + "; COMP_WORDS=(" + words +
                                     "); COMP_CWORD=" + std::to_string(count) +
                                     "; _qmedit; echo \"${COMPREPLY[@]}\"";
        const auto result = test::runProgram("/bin/bash", {"--norc", "-c", commands},
                                             {{"QMEDIT_PROJECT=" + project(), "PATH=/usr/bin:/bin"}, {}});
        EXPECT_EQ(result.err, "");
        return result.out.trimmed();
    };
    const std::string program = QMEDIT_PROGRAM;
    EXPECT_EQ(completed(program + " sh", 1), "show");
    EXPECT_EQ(completed(program + " header " + item, 2), item);
    EXPECT_EQ(completed(program + " undo mark", 2), "Market\\ Day");
    EXPECT_EQ(completed(program + " import " + script.substr(0, script.size() - 4), 2), script);
}

} // namespace
