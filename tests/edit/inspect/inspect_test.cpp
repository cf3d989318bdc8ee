#include "edit/inspect/content_diff.h"
#include "edit/inspect/usage.h"
#include "edit/inspect/verification.h"
#include "edit/manager/edit_manager.h"
#include "edit/model/transition.h"
#include "platform/effects/effect_instance.h"
#include "tests/edit/manager/managed_project.h"
#include "tests/support/edit_builder.h"

#include <algorithm>
#include <gtest/gtest.h>
#include <numeric>

// What an application asks of edits without the command line.

namespace {

/// A channel of the difference in one line: "V1 changed [1, 4] -1 +2".
std::string lineOf(const ChannelDiff& channel) {
    static constexpr const char* kKinds[] = {"changed", "added", "removed"};
    String line = channel.name + " " + kKinds[static_cast<size_t>(channel.kind)];
    for (const ChannelDiff::Span& span : channel.spans) {
        line += String::format(" [%g, %g]", span.from, span.to);
    }
    return line + String::format(" -%zu +%zu", channel.removed.size(), channel.added.size());
}

TEST(Inspect, TellsWhereTwoEditsDiffer) {
    const test::EditBuilder builder = test::EditBuilder().video(2).audio(1).levels(1).clips({4, -1, 5});
    const EditPtr before = builder.build();
    const EditPtr after = before->copy();
    after->setName("Reel 2");
    cel& picture = *after->get_edit_cel_p(0);
    channel_event other = *picture.getChanEventPtr(4);
    other.strip = cookie("M000A000");
    ASSERT_TRUE(picture.setEvent(4, other));
    static_cast<void>(after->addChan(VideoChan));
    const EditReport reports[] = {reportOf(*before, {}), reportOf(*after, {})};
    const EditContent contents[] = {contentOf(*before, reports[0]), contentOf(*after, reports[1])};

    std::vector<std::string> lines;
    const EditDiff diff = diffOf(reports[0], reports[1]);
    std::transform(diff.channels.begin(), diff.channels.end(), std::back_inserter(lines), lineOf);
    EXPECT_EQ(lines, (std::vector<std::string>{"V1 changed [5, 10] -1 +1", "V3 added -0 +0"}));
    const ContentDiff content = contentDiffOf(contents[0], contents[1]);
    ASSERT_EQ(content.header.size(), 1U);
    EXPECT_EQ(content.header[0].key, "NAME");
    EXPECT_TRUE(content.levels.empty() && !content.groups.changed);

    EXPECT_TRUE(diffOf(reports[0], reports[0]).same());
    EXPECT_TRUE(contentDiffOf(contents[1], contents[1]).same());
}

/// A row of clips, each known by a number and one second long but for every third; 0 is a gap, below 0 black.
EditReport rowOf(const std::vector<int>& clips) {
    EditReport report;
    ChannelReport channel;
    channel.place = "V1";
    channel.type = VideoChan;
    report.sources = {{black_cookie, SourceKind::Black, {}, {}, false, {}, {}},
                      {cookie("E0001000"), SourceKind::Shot, {}, {}, false, {}, {}}};
    double time = 0;
    for (const int clip : clips) {
        const double length = clip % 3 == 0 ? 2 : 1;
        PairReport pair;
        pair.in = time;
        pair.out = time += length;
        pair.stripIn = clip > 0 ? clip * 10 : 0;
        pair.stripOut = pair.stripIn + length;
        pair.source = clip > 0 ? 1 : 0;
        if (clip != 0) {
            channel.pairs.push_back(pair);
        }
    }
    report.channels.push_back(channel);
    return report;
}

TEST(Inspect, TellsOfWhatMovedByHowFar) {
    const struct {
        const char* what;
        std::vector<int> before;
        std::vector<int> after;
        const char* told; ///< -removed +added, then of each run its count, from, to and by; "!" for the rest
    } cases[] = {
        {"nothing", {1, 2, 3}, {1, 2, 3}, "-0 +0"},
        {"one taken out", {1, 2, -1, 4, 5}, {1, -1, 4, 5}, "-1 +0 3 2-5 -1!"},
        {"one put in", {1, 2, 4, 5}, {1, 7, 2, 4, 5}, "-0 +1 3 1-4 1!"},
        {"two that change places", {1, 2, 4, 5, 7}, {1, 5, 4, 2, 7}, "-0 +0 1 1-2 2 1 3-4 -2"},
        {"a block that moves", {1, 2, 3, 4, 5}, {4, 5, 1, 2, 3}, "-0 +0 3 0-4 2 2 4-6 -4"},
        {"a clip that is played again and again", {1, 1, 1, 2}, {2, 1, 1, 1}, "-0 +0 1 0-1 3 1 3-4 -3"},
        {"black alone is no clue", {-1, 2, 0, 4}, {0, 4, -1}, "-2 +1 1 4-5 -2"},
        {"a clip more of those that are alike", {1, 2, 1, 4}, {1, 1, 2, 1, 4}, "-0 +1 3 1-4 1!"},
        {"trimmed", {1, 3, 2}, {1, 4, 2}, "-1 +1 1 3-4 -1!"},
    };
    for (const auto& its : cases) {
        const EditDiff diff = diffOf(rowOf(its.before), rowOf(its.after));
        String told = "-0 +0";
        if (!diff.channels.empty()) {
            const ChannelDiff& channel = diff.channels[0];
            told = String::format("-%zu +%zu", channel.removed.size(), channel.added.size());
            for (const MovedRun<PairReport>& run : channel.moved) {
                told += String::format(" %zu %g-%g %g%s", run.count, run.from, run.to, run.by,
                                       run.isRest ? "!" : "");
            }
        }
        EXPECT_EQ(told, its.told) << its.what;
    }
    EditContent levels[2];
    levels[0].levels = {{"A1 levels", {{1, 0.5F}, {2, 1}, {3, 0.5F}, {5, 1}}}};
    levels[1].levels = {{"A1 levels", {{1, 0.5F}, {6, 1}, {7, 0.5F}, {9, 1}}}};
    const LevelsDiff nodes = contentDiffOf(levels[0], levels[1]).levels.at(0);
    ASSERT_EQ(nodes.moved.size(), 1U);
    EXPECT_TRUE(nodes.moved[0].count == 3 && nodes.moved[0].by == 4 && nodes.removed.empty());
    EditReport cues[2] = {rowOf({}), rowOf({})};
    cues[0].cues = {{1, 0, "a", 0, -1, false}, {2, 0, "b", 0, -1, false}, {3, 0, "b", 0, -1, false}};
    cues[1].cues = {{4, 0, "b", 0, -1, false}, {5, 0, "b", 0, -1, false}};
    const EditDiff markers = diffOf(cues[0], cues[1]);
    ASSERT_TRUE(markers.cuesMoved.size() == 1 && markers.cuesRemoved.size() == 1);
    EXPECT_TRUE(markers.cuesMoved[0].count == 2 && markers.cuesMoved[0].by == 2 && markers.cuesDiffer());
    std::vector<int> long1(20000);
    std::iota(long1.begin(), long1.end(), 1);
    std::vector<int> long2(long1.rbegin(), long1.rend());
    const EditDiff turned = diffOf(rowOf(long1), rowOf(long2));
    EXPECT_EQ(turned.channels.at(0).removed.size() + turned.channels.at(0).added.size(), 0U)
        << "every clip is known again, in no more steps than a test has time for";
}

TEST(Inspect, VerifiesAProjectAndTellsWhoPlaysWhat) {
    const test::ManagedProject project;
    const cookie items[] = {cookie("E0001000"), cookie("E0002000"), cookie("E0003000")};
    for (const cookie& item : items) {
        ASSERT_TRUE(test::ManagedProject::save("cut", item));
    }
    const EditPtr edit(items[1], eOpenExisting);
    edit->get_edit_cel_p(edit->addChan(VideoChan))->appendEventPair(items[0], 0, 0, 2);
    edit->init_dirty();
    ASSERT_TRUE(edit_manager::flush_edit(items[1]));
    std::string bytes = project.read("E0003000.qme");
    bytes[bytes.size() / 2] = static_cast<char>(bytes[bytes.size() / 2] ^ 1);
    project.write("E0003000.qme", bytes);
    project.write("reel.qme", project.read("E0001000.qme"));

    std::vector<VerifiedFile> files;
    ASSERT_TRUE(verifyProject(project.folder(), {}, files));
    std::vector<std::string> found;
    for (const VerifiedFile& file : files) {
        found.push_back(file.name + (file.faults.empty() ? " sound" : " not sound"));
    }
    EXPECT_EQ(found, (std::vector<std::string>{"E0001000.qme sound", "E0002000.qme sound",
                                               "E0003000.qme not sound", "reel.qme not sound"}));

    const auto read = [](const cookie& item, EditPtr& to) {
        to = EditPtr(new Edit);
        return to->read_file(item, eOpenExisting) == Edit::kReadOk ? Qx::Status()
                                                                   : Qx::Status::failure(to->lastFileError());
    };
    const auto users = findUsers(items[0], {items, items + 3}, read);
    ASSERT_EQ(users.size(), 2U); // one plays it, one may
    EXPECT_TRUE(users[0].edit == items[1] && users[0].problem.empty());
    EXPECT_TRUE(users[1].edit == items[2] && !users[1].problem.empty());
}

TEST(Inspect, VerifiesThatTransitionsHaveTheirMaterial) {
    const test::ManagedProject project;
    const cookie shot("E0001000");
    const cookie sequence("E0002000");
    ASSERT_TRUE(test::ManagedProject::save("cut", shot));
    ASSERT_TRUE(test::ManagedProject::save("cut", sequence));
    const EditPtr source(shot, eOpenExisting);
    const double end = 6;
    source->get_edit_cel_p(source->addChan(VideoChan))->appendEventPair(black_cookie, 0, 0, end);
    source->init_dirty();
    ASSERT_TRUE(edit_manager::flush_edit(shot));
    const EditPtr edit(sequence, eOpenExisting);
    cel& content = *edit->get_edit_cel_p(edit->addChan(VideoChan));
    const IdStamp id = IdStamp::fresh(IdStampMagic::EffectNode);
    content.appendEventPair(shot, 0, 0, end - 1);
    content.appendEventPair(black_cookie, 0, end - 1, 4);
    for (const double length : {1.0, 3.0}) {
        const int lain = content.find_ceh(end - 1, CE_IN_POINT).index() / 2;
        ASSERT_TRUE(length == 1 || Transitions::resolve(content, lain, end - 1));
        ASSERT_TRUE(Transitions::lay(content, end - 1, end - 1, end - 1 + length, id));
        edit->objectStore().storeObject(id, Fx::makeEffect(Fx::kDissolve));
        edit->init_dirty();
        ASSERT_TRUE(edit_manager::flush_edit(sequence));
        std::vector<VerifiedFile> files;
        ASSERT_TRUE(verifyProject(project.folder(), {sequence}, files));
        ASSERT_EQ(files.size(), 1U);
        EXPECT_EQ(files[0].faults.size(), length == 1 ? 0U : 1U);
        EXPECT_TRUE(length == 1 || files[0].faults[0].find("lacks 2 s") != String::npos)
            << files[0].faults[0];
    }
}

} // namespace
