#include "tests/tools/qmedit_fixture.h"

namespace {

/// The lines of the picture, from the ruler to the legend: they follow the summary and a blank line.
String pictureOf(const String& shown) {
    const size_t start = shown.find("\n\n", 1);
    if (start == String::npos)
        return shown;
    return shown.substr(start + 2, shown.find("\n\n", start + 2) - start - 1);
}

TEST_F(Qmedit, DrawsTracksToScale) {
    const String item = imported(kShortList);
    EXPECT_EQ(pictureOf(run({"show", item}, {"LANG=en_GB.UTF-8", "COLUMNS=56"}).out),
              "     ╷10:00:00:00             ╷10:00:05:00\n"
              "          ▼ ship\n"
              "     ┌──────────────┬────┐    ┌────────────────────────┐\n"
              " V1  │ harbour      │░░░░│    │ harbour                │\n"
              "     ├──────────────┴────┴────┴────────────────────────┤\n"
              " A1  │ gulls                                           │\n"
              "     └─────────────────────────────────────────────────┘\n"
              "     │ cut   ░ black   blank gap   ▼ marker\n");
    EXPECT_EQ(pictureOf(run({"show", item}, {"LC_ALL=C", "LANG=en_GB.UTF-8", "COLUMNS=46"}).out),
              "     +10:00:00:00        +10:00:05:00\n"
              "         v ship\n"
              "     +-----------+---+   +-------------------+\n"
              " V1  | harbour   |...|   | harbour           |\n"
              "     +-----------+---+---+-------------------+\n"
              " A1  | gulls                                 |\n"
              "     +---------------------------------------+\n"
              "     | cut   . black   blank gap   v marker\n");
}

TEST_F(Qmedit, NoLineOfThePictureIsWiderThanTheConsole) {
    const String item = imported(kShortList);
    for (const int width : {30, 40, 56, 80, 120, 333}) {
        const String columns = std::to_string(width);
        for (const String& row :
             run({"show", item, "--events", "--width", columns}, {"LC_ALL=C", "COLUMNS=9"}).out.split('\n'))
            EXPECT_LE(row.size(), static_cast<size_t>(width)) << row;
        for (const String& row :
             pictureOf(run({"show", item}, {"LC_ALL=C", "COLUMNS=" + columns}).out).split('\n'))
            EXPECT_LE(row.size(), static_cast<size_t>(width)) << row;
    }
    const auto widest = [&](std::vector<std::string> environment) {
        environment.emplace_back("LC_ALL=C");
        size_t most = 0;
        for (const String& row : pictureOf(run({"show", item}, environment).out).split('\n'))
            most = std::max(most, row.size());
        return most;
    };
    EXPECT_EQ(widest({}), widest({"COLUMNS=100"})) << "a hundred columns where nothing says how many";
    EXPECT_EQ(widest({"COLUMNS=-7"}), widest({"COLUMNS=100"}));
}

TEST_F(Qmedit, NoColourWhereOutputIsNoTerminal) {
    const String item = imported(kShortList);
    EXPECT_EQ(run({"show", item}, {"TERM=xterm-256color"}).out.find('\x1b'), String::npos);
    EXPECT_NE(run({"show", item, "--colour", "always"}, {"NO_COLOR=1"}).out.find('\x1b'), String::npos);
}

TEST_F(Qmedit, ListsEventsWithTimecodesAndGaps) {
    const String item = imported(kShortList);
    const String out = run({"show", item}).out;
    for (const char* line : {
             "  1  10:00:00:00  10:00:03:00  00:00:10:00  00:00:13:00    3:00  harbour\n",
             "  2  10:00:03:00  10:00:04:00                              1:00  black\n",
             "     10:00:04:00  10:00:05:00                              1:00  gap\n",
             "  1  10:00:00:00  10:00:10:00  00:01:00:00  00:01:10:00   10:00  gulls\n",
             "       10:00:01:00  ship (red)\n",
         })
        EXPECT_NE(out.find(line), String::npos) << line << out;
    EXPECT_NE(out.find("harbour (50%)"), String::npos) << out;

    const String later = imported("008  TAPE7 V C 00:00:10:00 00:00:13:00 10:00:00:00 10:00:03:00\n"
                                  "011  TAPE8 V C 00:00:10:00 00:00:13:00 18:24:11:15 18:24:14:15\n");
    const String events = run({"show", later, "--events", "--width", "120"}).out;
    for (const char* line : {
             " 10:00:03:00  18:24:11:15                            8:24:08:15                     gap\n",
             "  2  011    18:24:11:15  18:24:14:15  00:00:10:00  00:00:13:00        3:00  cut         TAPE8  "
             "TAPE8\n",
         })
        EXPECT_NE(events.find(line), String::npos) << line << events;
    const auto pair = shown(later).at("channels").at(0).at("pairs").at(1);
    EXPECT_EQ(pair.at("event").get<std::string>() + pair.at("reel").get<std::string>() +
                  pair.at("transition").get<std::string>(),
              "011TAPE8cut");
}

} // namespace
