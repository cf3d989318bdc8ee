#include "tests/edit/editing/editing_fixture.h"
#include "tests/support/every_fault.h"
#include "tests/support/tree_snapshot.h"

#include "edit/model/channel_group_list.h"
#include "edit/project/permissions_manager.h"

#include <atomic>
#include <thread>

using namespace test;
using Op = edit_operation;

namespace {

constexpr double kNone = Qx::kNoTime;

/// Applies to all channels, with marks.
Editor::Result apply(const EditPtr& from, const Marks& of, const EditPtr& to, const Marks& marks, Op op,
                     unsigned flags = 0) {
    return Editor::apply(from.valid() ? moduleOf(from, of) : EditModule(), moduleOf(to, marks), op, flags);
}

class EditorTest : public EditingTest {
protected:
    /// Adds a cue that is attached to what a channel plays at a time.
    static void addCue(Edit& edit, const char* text, double time, int chan) {
        Vector<cel*> cels;
        for (int i = 0; i < edit.getNumChans(); ++i) {
            cels.push_back(edit.get_edit_cel_p(i));
        }
        ASSERT_TRUE(edit.get_cues().add_cue_point(text, time, chan, 0, cels, true));
    }
    /// "text chan time" for each cue.
    static std::string cuesOf(const Edit& edit) {
        std::string all;
        for (size_t i = 0; i < edit.get_cues().get_num_cue_points(0); ++i) {
            const cue_point& cue = *edit.get_cues().get_cue_point(i, 0);
            all += cue.text() + " " + std::to_string(cue.channel()) + " " + Qx::doubleToText(cue.editTime()) +
                   ";";
        }
        return all;
    }
    static double levelAt(const Edit& edit, int chan, double time) {
        const AudLevelsCel levels = edit.getLevelsCel(edit.getAudCel(edit.getId(chan)).getLevelsChanID());
        return static_cast<double>(levels.getNodeStore().levelAt(time));
    }
};

TEST_F(EditorTest, ARefusedOperationHasChangedNothing) {
    struct Case {
        const char* reason;
        Op op;
        Marks source;
        Marks destination;
        unsigned flags = 0;
    };
    const Case cases[] = {
        {"Unhandled EditOperation", Op::NoOperation, {}, {1, 2}},
        {"Unhandled EditOperation", static_cast<Op>(17), {}, {1, 2}},
        {"flags that do not exist", Op::Insert, {1, 2}, {1}, 64},
        {"source's region is empty", Op::Insert, {1, 1, 1}, {1}},
        {"source's region is empty", Op::Insert, {1, 1.01}, {1}}, // less than a frame
        {"before its marked region", Op::Insert, {5, 6}, {1}},
        {"two different marks", Op::Insert, {1, kNone, kNone}, {1}},
        {"neither a mark nor a current time", Op::Insert, {1, 2}, {kNone, kNone, kNone}},
        {"before its start", Op::Replace, {-1, 2}, {1}},
        {"before the start of the edit", Op::BackReplace, {1, 3}, {kNone, 1}},
        {"before the start of the edit", Op::BackInsert, {1, 3}, {kNone, 1}},
        {"before the start of the edit", Op::Remove, {}, {-2, 3}},
        {"before its start", Op::BackReplaceMarked, {kNone, 1}, {1, 4}},
        {"greatest time", Op::Insert, {1, 3}, {1e9}},
        {"greatest time", Op::InsertMarked, {1, 3}, {0, 9.99e8 + 1e6}},
        {"no marked region", Op::Remove, {}, {}},
        {"marked region is empty", Op::Lift, {}, {2, 2, 2}},
        {"nothing lies in", Op::Remove, {}, {7, 9}},
        {"nothing lies in", Op::Lift, {}, {8, 9}},
        {"exactly two", Op::SwapTracks, {}, {1, 2}},
        {"V3 ends at 6 s, and CopyTrack makes no channel longer", Op::CopyTrack, {}, {5, 7}},
        {"nothing lies in", Op::CopyTrack, {}, {9, 10}},
        {"nothing is black", Op::FillBlack, {0, 2}, {2}},
    };
    const EditPtr edit = make({"V AAAABBB", "V CCCCCCC", "V DDDDDD", "A EEEEEEE"});
    const EditPtr from = make({"V ddee", "V ", "V ", "A ffff"}, 101);
    ASSERT_TRUE(apply({}, {}, edit, {1, 2}, Op::Lift).valid()); // a chain and a clipboard to be lost
    edit_manager::flush_changes();
    const String before = editState(*edit);
    const String kept = editState(*clipboard());
    const auto files = treeSnapshot(folder().path());
    EditModule nothing = moduleOf(from, {0, 2});
    nothing.selectAll(false);
    for (const Op op : {Op::Replace, Op::Insert, Op::InsertMarked, Op::ReplaceToEnd, Op::BackInsert}) {
        const Editor::Result result = Editor::apply(nothing, moduleOf(edit, {3, 5}), op);
        EXPECT_NE(result.reason().find("no selected channel of the source"), String::npos);
        EXPECT_TRUE(editState(*edit) == before && treeSnapshot(folder().path()) == files);
    }
    for (const Case& its : cases) {
        SCOPED_TRACE(String(editOperationName(its.op)) + " " + its.reason);
        const Editor::Result result = apply(from, its.source, edit, its.destination, its.op, its.flags);
        EXPECT_FALSE(result.valid());
        EXPECT_NE(result.reason().find(its.reason), String::npos) << result.reason();
        EXPECT_EQ(result.status().code(), Qx::StatusCode::BadArgument);
        EXPECT_TRUE(editState(*edit) == before);
        EXPECT_TRUE(editState(*clipboard()) == kept);
        EXPECT_TRUE(treeSnapshot(folder().path()) == files);
    }
}

TEST_F(EditorTest, AReadOnlyOrUnsafeEditIsRefused) {
    const EditPtr edit = make({"V AAAABBB"});
    ASSERT_TRUE(PermissionsManager::setReadOnly(edit->get_cookie(), true));
    EXPECT_NE(apply({}, {}, edit, {1, 2}, Op::Lift).reason().find("read-only"), String::npos);
    ASSERT_TRUE(PermissionsManager::setReadOnly(edit->get_cookie(), false));
    edit->set_read_only(true);
    EXPECT_EQ(apply({}, {}, edit, {1, 2}, Op::Lift).status().code(), Qx::StatusCode::ReadOnly);

    // Without channels an edit cannot be written, so there is nothing that undo could go back to.
    const EditPtr bare = make({"V "}, 101);
    bare->removeChans(false);
    const EditPtr from = editOf({"V dd"});
    EXPECT_NE(apply(from, {}, bare, {0}, Op::Insert).reason().find("cannot be backed up"), String::npos);
    EXPECT_EQ(bare->getNumChans(), 0);
    EXPECT_TRUE(apply(from, {}, bare, {0}, Op::Insert, Editor::NoBackup).valid());
    EXPECT_EQ(drawRows(*bare), Rows{"V dd"});
}

TEST_F(EditorTest, ObserversHearOnceWithEverythingInPlace) {
    const EditPtr edit = make({"V AAAA"});
    const EditPtr from = editOf({"V dd", "A ff"});
    std::vector<String> heard;
    const auto changes = edit->getChangeDescriptionServer().addListener([&](const EditModification& change) {
        heard.push_back(std::to_string(change.type()) + " " + drawRows(*edit).front());
    });
    const auto messages = edit->addListener(Edit::getChanAddedNotifyMsgType(), [&](const NotifyMsg& message) {
        heard.push_back(message.text());
    });
    const Editor::Result result = apply(from, {}, edit, {1}, Op::Insert);
    EXPECT_EQ(result.notificationType(), kChansInserted);
    EXPECT_EQ(heard, (std::vector<String>{edit->get_cookie_str() + " 2 32768 1", "27 V AddAAA"}));
    heard.clear();
    EXPECT_EQ(apply({}, {}, edit, {1, 3}, Op::Remove).notificationType(), kOpRemove);
    EXPECT_EQ(heard, std::vector<String>{"4 V A|AAA"});
}

TEST_F(EditorTest, ResultsTellWhereTheCurrentTimeBelongs) {
    const EditPtr from = editOf({"V ddee"});
    struct Case {
        Op op;
        Marks marks;
        double current;
        bool markValid;
    };
    for (const Case& its : {Case{Op::Replace, {2}, 4, true}, Case{Op::Insert, {2}, 4, false},
                            Case{Op::Remove, {2, 5}, 2, false}, Case{Op::BackReplace, {kNone, 5}, 3, true},
                            Case{Op::ReplaceToEnd, {2}, 4, true}, Case{Op::Lift, {2, 5, 6}, 6, true}}) {
        const EditPtr edit = make({"V AAAABBB"});
        const Editor::Result result = apply(from, {1, 3}, edit, its.marks, its.op);
        EXPECT_DOUBLE_EQ(result.curTime(), its.current) << editOperationName(its.op);
        EXPECT_EQ(result.markValid(), its.markValid) << editOperationName(its.op);
    }
}

TEST_F(EditorTest, ChannelsThatAreMissingAreAdded) {
    const EditPtr from = editOf({"V dd", "A ff", "A ", "A gg", "A .."});
    from->groupChannels({from->getId(1), from->getId(3)}, ChannelGroup::eStereo);
    const EditPtr edit = make({"V AAAA"});
    EXPECT_TRUE(apply(from, {}, edit->copy(), {1}, Op::Insert, Editor::NoNewChannels).valid());
    EXPECT_EQ(edit->getNumChans(), 1);
    ASSERT_TRUE(apply(from, {}, edit, {1}, Op::Insert).valid());
    // The third sound channel holds something, the fourth only silence.
    EXPECT_EQ(drawRows(*edit), (Rows{"V AddAAA", "A .ff...", "A ......", "A .gg..."}));
    ASSERT_EQ(edit->numGroups(), 1u);
    EXPECT_EQ(edit->getTrackGroup(0)->getType(), ChannelGroup::eStereo);
    EXPECT_EQ(edit->getTrackGroup(0)->getChans(), (Vector<IdStamp>{edit->getId(1), edit->getId(3)}));

    // What is deselected asks for no more.
    EditModule some = moduleOf(edit, {0});
    some.selectChan(edit->getId(2), false);
    some.selectChan(edit->getId(3), false);
    ASSERT_TRUE(Editor::apply(moduleOf(from, {}), some, Op::Replace).valid());
    EXPECT_EQ(drawRows(*edit), (Rows{"V dd|dAAA", "A ff|f...", "A ......", "A .gg..."}));
    EXPECT_EQ(edit->numGroups(), 1u);

    Rows many(32, "A A");
    many.insert(many.begin(), "V A");
    const EditPtr full = make(many, 101);
    const EditPtr tooMany = editOf(Rows(32, "A d"));
    addRows(*tooMany, {"V d"});
    EXPECT_TRUE(apply(tooMany, {}, full, {0}, Op::Replace).valid());
    EXPECT_EQ(full->getNumChans(), 33);
}

TEST_F(EditorTest, ChannelsWithMarksOfTheirOwnKeepTheirDistance) {
    const EditPtr from = editOf({"V dddddd", "A ffffff"});
    EditModule source = moduleOf(from, {1, 3});
    source.setMarkTime(from->getId(1), EditModule::Range(2, 5)); // sound begins later and ends later
    EditPtr edit = make({"V AAAAA", "A BBBBB"});
    ASSERT_TRUE(Editor::apply(source, moduleOf(edit, {1}), Op::Insert).valid());
    EXPECT_EQ(drawRows(*edit), (Rows{"V Add..AAAA", "A B.fffBBBB"}));

    edit = make({"V AAAAA", "A BBBBB"}, 101);
    EditModule destination = moduleOf(edit, {1});
    destination.setMarkTime(edit->getId(1), 3, Qx::MarkTypes::InMark);
    const Editor::Result result = Editor::apply(moduleOf(from, {1, 3}), destination, Op::Insert);
    EXPECT_FALSE(result.syncLoss()); // both move by two seconds
    EXPECT_EQ(drawRows(*edit), (Rows{"V AddAAAA", "A BBBffBB"}));

    // A swap takes the one region that covers all.
    edit = make({"V AAABB", "V CCDDD"}, 102);
    destination = moduleOf(edit, {1, 2});
    destination.setMarkTime(edit->getId(1), EditModule::Range(2, 4));
    ASSERT_TRUE(Editor::apply({}, destination, Op::SwapTracks).valid());
    EXPECT_EQ(drawRows(*edit), (Rows{"V ACDDB", "V CAABD"}));
}

TEST_F(EditorTest, AShotIsNamedNotCopied) {
    const EditPtr shot =
        editOf({"V      ddee", "A      ffff"}); // begins at 5 s, as its material's clock does
    shot->set_original_material(1);
    shot->get_edit_cel_p(1)->get_start_ceh().set_strip_level(0.5F);
    ASSERT_TRUE(shot->isShot());
    const EditPtr edit = make({"V AAAA", "A BBBB"});
    ASSERT_TRUE(apply(shot, {}, edit, {1}, Op::Insert).valid());
    for (int chan = 0; chan < 2; ++chan) {
        const cel& its = *edit->get_edit_cel_p(chan);
        ASSERT_EQ(its.numPairs(), 3);
        const channel_event& laid = *its.getChanEventPtr(2);
        EXPECT_EQ(laid.strip, shot->get_cookie());
        EXPECT_DOUBLE_EQ(laid.stripTime, 5);
        EXPECT_DOUBLE_EQ(its.getChanEventPtr(3)->stripTime, 9);
        EXPECT_EQ(laid.level, 1.0F);
    }
    ASSERT_TRUE(apply(shot, {4, 6}, edit, {0}, Op::Replace).valid()); // from before its beginning
    EXPECT_TRUE(edit->get_edit_cel_p(0)->getChanEventPtr(0)->strip.isBlack());
    EXPECT_DOUBLE_EQ(edit->get_edit_cel_p(0)->get_strip_time(1), 5);
    // In its own place a shot is edited like anything else.
    ASSERT_TRUE(apply(shot, {5, 6}, shot, {9}, Op::Insert).valid());
    EXPECT_EQ(drawRows(*shot).front(), "V      ddeed");
}

TEST_F(EditorTest, TheClipboardHoldsWhatWentAndIsUndoneToo) {
    const EditPtr from = editOf({"V dd", "A ff"});
    EditPtr edit = make({"V AAAABBB", "A CCCCDDD"});
    const cookie item = edit->get_cookie();
    ASSERT_TRUE(apply({}, {}, edit, {2, 5}, Op::Remove).valid());
    EXPECT_EQ(drawRows(*clipboard()), (Rows{"V AAB", "A CCD"}));
    EXPECT_TRUE(Editor::wasClipboardUsed(edit));
    ASSERT_TRUE(apply(from, {}, edit, {1}, Op::Replace).valid());
    EXPECT_EQ(drawRows(*clipboard()), (Rows{"V AB", "A CD"}));
    ASSERT_TRUE(apply(from, {}, edit, {1}, Op::Insert).valid());
    EXPECT_FALSE(Editor::wasClipboardUsed(edit));
    EXPECT_EQ(drawRows(*clipboard()), (Rows{"V AB", "A CD"}));
    ASSERT_TRUE(apply({}, {}, edit, {0, 1}, Op::Remove, Editor::KeepClipboard).valid());
    EXPECT_EQ(drawRows(*clipboard()), (Rows{"V AB", "A CD"}));
    edit.invalidate();
    for (int i = 0; i < 3; ++i) {
        ASSERT_TRUE(edit_manager::undoRequest(item));
    }
    EXPECT_EQ(drawRows(*clipboard()), (Rows{"V AAB", "A CCD"}));

    // Pasting takes nothing away from the clipboard.
    edit = edit_manager::openEdit(item, eOpenExisting);
    ASSERT_TRUE(apply(clipboard(), {}, edit, {0}, Op::Replace).valid());
    EXPECT_EQ(drawRows(*edit), (Rows{"V AAB|B", "A CCD|D"}));
    EXPECT_EQ(drawRows(*clipboard()), (Rows{"V AAB", "A CCD"}));

    // That it was looked for and not there does not keep it away.
    ASSERT_TRUE(edit_manager::delete_edit_file_and_backups(clipboard_cookie, true));
    EXPECT_FALSE(clipboard().valid());
    ASSERT_TRUE(apply({}, {}, edit, {0, 2}, Op::Lift).valid());
    ASSERT_TRUE(clipboard().valid());
    EXPECT_EQ(drawRows(*clipboard()), (Rows{"V AA", "A CC"}));
}

TEST_F(EditorTest, LevelsGoWithTheirSound) {
    const EditPtr from = editOf({"A ffff"});
    AudLevelsCel levels = AudLevelsCel::create();
    levels.insertNode(0, 0.25F);
    ASSERT_TRUE(from->addLevelsChan(from->getId(0), levels).valid());
    EditPtr edit = make({"V AAAAAA", "A BBBBBB"});
    edit->get_edit_cel_p(1)->get_start_ceh().set_strip_level(0.5F);
    edit->get_edit_cel_p(1)->get_end_ceh().set_strip_level(0.5F);
    ASSERT_TRUE(apply(from, {1, 3}, edit, {2}, Op::Insert).valid());
    ASSERT_EQ(edit->getNumChans(), 3);
    EXPECT_NEAR(levelAt(*edit, 1, 1), 0.5, 1e-6); // the clip's own, in the new channel
    EXPECT_NEAR(levelAt(*edit, 1, 3), 0.25, 1e-6);
    EXPECT_NEAR(levelAt(*edit, 1, 6), 0.5, 1e-6);
    ASSERT_TRUE(apply({}, {}, edit, {0, 3}, Op::Remove).valid());
    EXPECT_NEAR(levelAt(*edit, 1, 0.5), 0.25, 1e-6);
    EXPECT_NEAR(levelAt(*edit, 1, 2), 0.5, 1e-6);
    const EditPtr silent = editOf({"A gggg"});
    ASSERT_TRUE(apply(silent, {}, edit->copy(), {0}, Op::ReplaceMaterial).valid());
    EXPECT_NEAR(levelAt(*edit, 1, 0.5), 0.25, 1e-6);
    ASSERT_TRUE(apply(silent, {}, edit, {0}, Op::Replace).valid());
    EXPECT_NEAR(levelAt(*edit, 1, 0.5), 1, 1e-6);
    EXPECT_EQ(edit->getNumChans(), 3);
}

TEST_F(EditorTest, SyncLossesAreRecordedAndHeal) {
    const EditPtr from = editOf({"V ddd"});
    const EditPtr edit = make({"V AAAAA", "A BBBBB", "A CC..."});
    EditModule picture = moduleOf(edit, {2});
    picture.selectChans(false, AudioChan, Edit_Chan_SubType::ANY);
    EXPECT_TRUE(Editor::apply(moduleOf(from, {}), picture, Op::Insert).syncLoss());
    EXPECT_DOUBLE_EQ(edit->getSyncLoss(edit->getId(1)), -3);
    EXPECT_EQ(edit->getSyncLoss(edit->getId(0)), 0);
    EXPECT_EQ(edit->getSyncLoss(edit->getId(2)), 0); // only silence lies there
    EXPECT_EQ(drawRows(*edit), (Rows{"V AAdddAAA", "A BBBBB...", "A CC......"}));
    EditModule back = moduleOf(edit, {2, 5});
    back.selectChans(false, AudioChan, Edit_Chan_SubType::ANY);
    EXPECT_FALSE(Editor::apply({}, back, Op::Remove).syncLoss());
    EXPECT_EQ(edit->getSyncLoss(edit->getId(1)), 0);
    EXPECT_EQ(drawRows(*edit), (Rows{"V AA|AAA...", "A BBBBB...", "A CC......"}));
    EditModule sound = moduleOf(edit, {1, 2});
    sound.selectChans(false, VideoChan, Edit_Chan_SubType::ANY);
    EXPECT_TRUE(Editor::apply({}, sound, Op::Remove).syncLoss());
    EXPECT_DOUBLE_EQ(edit->getSyncLoss(edit->getId(1)), -1);
}

TEST_F(EditorTest, CuesFollowTheirEvents) {
    const EditPtr from = editOf({"V dd"});
    const EditPtr edit = make({"V AAABBBCCC", "V DDDEEEFFF"});
    addCue(*edit, "a", 1, 0);
    addCue(*edit, "b", 4, 0);
    addCue(*edit, "e", 5, 1);
    edit->get_cues().add_cue_point("free", 8, 0, 0, {}, false);
    ASSERT_TRUE(apply(from, {}, edit, {2}, Op::Insert).valid());
    EXPECT_EQ(cuesOf(*edit), "a 0 1;b 0 6;e 1 7;free 0 8;");
    ASSERT_TRUE(apply({}, {}, edit, {2, 4}, Op::Remove).valid());
    ASSERT_TRUE(apply({}, {}, edit, {3, 5}, Op::SwapTracks).valid());
    EXPECT_EQ(drawRows(*edit), (Rows{"V AA|AEEBCCC", "V DD|DBBEFFF"}));
    EXPECT_EQ(cuesOf(*edit), "a 0 1;b 1 4;e 1 5;free 0 8;");
    ASSERT_TRUE(apply({}, {}, edit, {3, 6}, Op::Remove).valid());
    EXPECT_EQ(cuesOf(*edit), "a 0 1;free 0 8;"); // those of the events that went go with them
}

TEST_F(EditorTest, EffectsAreBoundToCopiesAndToBothPartsOfACut) {
    const EditPtr from = editOf({"V dd"});
    const auto bind = [](Edit& edit, int event) {
        const IdStamp id = edit.get_edit_cel_p(0)->getChanEventPtr(event)->id;
        edit.objectStore().storeObject(id.asString(), std::make_unique<ChannelGroupList>());
        return id;
    };
    const EditPtr edit = make({"V AAAABB"});
    const IdStamp whole = bind(*edit, 0);
    bind(*from, 0);
    ASSERT_TRUE(apply(from, {}, edit, {2}, Op::Insert).valid());
    const auto bound = [&] {
        std::string found;
        for (int i = 0; i < edit->get_edit_cel_p(0)->numEvents(); i += 2) {
            const IdStamp id = edit->get_edit_cel_p(0)->getChanEventPtr(i)->id;
            found += edit->objectStore().contains(id.asString()) ? (id == whole ? 'w' : 'c') : '-';
        }
        return found;
    };
    EXPECT_EQ(bound(), "wcc-"); // the whole's, the source's copy, the right part's copy, nothing on B
    ASSERT_TRUE(apply(from, {0, 1}, edit, {0.5}, Op::ReplaceMaterial).valid());
    EXPECT_EQ(bound(), "wcccc-"); // three pieces of the whole, the middle one with other material

    // Black with something bound to it stays apart.
    const EditPtr title = make({"V A..BC"}, 101);
    const IdStamp black = title->get_edit_cel_p(0)->getChanEventPtr(2)->id;
    title->objectStore().storeObject(black.asString(), std::make_unique<ChannelGroupList>());
    ASSERT_TRUE(apply({}, {}, title, {3, 4}, Op::Lift).valid());
    EXPECT_EQ(drawRows(*title), Rows{"V A..|.C"});
    // So does black that a cue would lose; other black of the channel is merged all the same.
    const EditPtr cued = make({"V AA..BBCC..DD"}, 102);
    addCue(*cued, "c", 8.5, 0);
    ASSERT_TRUE(apply({}, {}, cued, {6, 8}, Op::Lift).valid());
    ASSERT_TRUE(apply({}, {}, cued, {4, 5}, Op::Lift).valid());
    EXPECT_EQ(drawRows(*cued), Rows{"V AA...B..|..DD"});
    EXPECT_EQ(cuesOf(*cued), "c 0 8.5;");
}

TEST_F(EditorTest, FadesStampsAndLevelsStayWhereTheCutDidNotTouchThem) {
    const EditPtr from = editOf({"A dddd"});
    EditPtr edit = make({"A AAAABBBB"});
    cel& its = *edit->get_edit_cel_p(0);
    for (int i = 0; i < its.numEvents(); ++i) {
        ce_handle(&its, i).set_audioRamp_DurationQFrames(static_cast<uint16_t>(4 + i));
    }
    its.get_start_ceh().set_strip_level(0.5F);
    const channel_event first = its.get_event(0);
    const channel_event last = its.get_event(3);
    ASSERT_TRUE(apply(from, {0, 2}, edit, {1}, Op::Replace).valid());
    EXPECT_EQ(drawRows(*edit), Rows{"A AddABBBB"});
    const auto ramp = [&](int event) { return its.getChanEventPtr(event)->rampQFrames; };
    EXPECT_EQ(ramp(0), 4);
    EXPECT_EQ(ramp(1), 0); // at the cut
    EXPECT_EQ(ramp(4), 0);
    EXPECT_EQ(ramp(5), 5);
    EXPECT_EQ(ramp(7), 7);

    edit = make({"A AAAABBBB"}, 101);
    cel& kept = *edit->get_edit_cel_p(0);
    ASSERT_TRUE(kept.setEvent(0, first) && kept.setEvent(3, last));
    ASSERT_TRUE(apply(from, {0, 4}, edit, {0}, Op::ReplaceMaterial).valid());
    EXPECT_EQ(drawRows(*edit), Rows{"A ddddBBBB"});
    const channel_event& replaced = *kept.getChanEventPtr(0);
    EXPECT_EQ(replaced.id, first.id);
    EXPECT_EQ(replaced.rampQFrames, first.rampQFrames);
    EXPECT_EQ(replaced.level, first.level);
}

TEST_F(EditorTest, AFlatPictureGoesToBothEyes) {
    const EditPtr from = editOf({"V dd", "A ff"});
    const EditPtr edit = make({"V AAAA", "V BBBB", "A CCCC"});
    edit->groupChannels({edit->getId(0), edit->getId(1)}, ChannelGroup::eStereoscopic);
    ASSERT_TRUE(apply(from, {}, edit, {1}, Op::Insert).valid());
    EXPECT_EQ(drawRows(*edit), (Rows{"V AddAAA", "V BddBBB", "A CffCCC"}));
    const EditPtr stereo = editOf({"V dd", "V ee"});
    stereo->groupChannels({stereo->getId(0), stereo->getId(1)}, ChannelGroup::eStereoscopic);
    ASSERT_TRUE(apply(stereo, {}, edit, {0}, Op::Replace).valid());
    EXPECT_EQ(drawRows(*edit), (Rows{"V dd|dAAA", "V eedBBB", "A CffCCC"}));
}

TEST_F(EditorTest, WhateverTheDiskDoesTheEditIsTheOldOrTheNew) {
    int number = 1000;
    String before;
    String after;
    cookie item;
    Qx::Status refusal;
    const auto setUp = [&] {
        const EditPtr edit = make({"V AAAABBB", "A CCCCDDD"}, ++number);
        item = edit->get_cookie();
        before = contentState(*edit);
        return edit;
    };
    const auto act = [&](const EditPtr& edit, const auto& arm) {
        arm();
        const Editor::Result result = apply({}, {}, edit, {2, 5}, Op::Remove);
        after = contentState(*edit);
        refusal = result.status();
        return result.valid();
    };
    const auto check = [&](EditPtr& edit, const Met& met) {
        EXPECT_EQ(drawRows(*edit).front(), met.done ? "V AABB" : "V AAAABBB");
        EXPECT_TRUE(met.done || after == before);
        EXPECT_EQ(refusal.systemError(), met.done ? 0 : EIO) << refusal.reason();
        EXPECT_TRUE(edit_manager::flush_changes());
        edit.invalidate();
        ASSERT_TRUE(edit_manager::invalidateCache(item));
        edit = edit_manager::openEdit(item, eOpenExisting);
        ASSERT_TRUE(edit.valid());
        EXPECT_STREQ(contentState(*edit).c_str(), after.c_str());
        edit.invalidate();
        if (met.done) {
            ASSERT_TRUE(edit_manager::undoRequest(item));
            EXPECT_STREQ(contentState(*edit_manager::openEdit(item, eOpenExisting)).c_str(), before.c_str());
        }
        edit_manager::invalidateCache(clipboard_cookie);
    };
    EXPECT_GT(everyFault({Fault::Fails, EIO}, setUp, act, check), 3u);
}

TEST_F(EditorTest, AnotherThreadMaySaveMeanwhile) {
    const EditPtr edit = make({"V ABCDEFGH", "A ABCDEFGH"});
    const EditPtr from = editOf({"V dd", "A ff"});
    std::atomic<bool> done{false};
    std::thread saver([&] {
        while (!done) {
            edit_manager::flush_changes();
        }
    });
    for (int i = 0; i < 20; ++i) {
        EXPECT_TRUE(apply(from, {}, edit, {2}, Op::Insert).valid());
        EXPECT_TRUE(apply({}, {}, edit, {2, 4}, Op::Remove).valid());
    }
    done = true;
    saver.join();
    EXPECT_EQ(drawRows(*edit), (Rows{"V ABCDEFGH", "A ABCDEFGH"}));
}

TEST_F(EditorTest, WithoutTheManagerItWorksUnbacked) {
    const EditPtr loose = editOf({"V AAAA"});
    const auto files = treeSnapshot(folder().path());
    ASSERT_TRUE(apply({}, {}, loose, {1, 2}, Op::Remove, Editor::KeepClipboard).valid());
    EXPECT_EQ(drawRows(*loose), Rows{"V A|AA"});
    EXPECT_TRUE(treeSnapshot(folder().path()) == files);
    edit_manager::theEditManager(nullptr);
    ASSERT_TRUE(apply({}, {}, loose, {1, 2}, Op::Remove).valid());
    EXPECT_EQ(drawRows(*loose), Rows{"V A|A"});
    EXPECT_FALSE(Editor::wasClipboardUsed(loose));
}

} // namespace
