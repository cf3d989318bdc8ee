#include "edit/model/channel_group_list.h"
#include "edit/model/cue_list.h"
#include "platform/store/configb.h"
#include "tests/support/edit_builder.h"
#include "tests/tools/qmedit_fixture.h"

#include <filesystem>
#include <functional>

namespace {

const String kNote(100, 'x');

/// An effects channel that shows V1, two of picture, two of sound, levels of the first and a marker.
EditPtr edited(const std::function<void(Edit&)>& change) {
    static const EditPtr made =
        test::EditBuilder().effects(1).video(2).audio(2).levels(1).clips({4, -1, 5}).build();
    const EditPtr edit = made->copy();
    edit->set_cookie(cookie("E0001000"));
    edit->setName("Reel");
    edit->Opts().setString("NOTE", kNote);
    edit->get_cues().add_cue_point("ship", 1.0, kAnyCueChan, 0, {}, false);
    change(*edit);
    edit->init_dirty();
    return edit;
}

IdStamp chan(const Edit& edit, Edit_Chan_Type type, size_t place,
             Edit_Chan_SubType subtype = Edit_Chan_SubType::NONE) {
    Vector<IdStamp> chans;
    edit.getChans(chans, type, subtype);
    return chans[place];
}
IdStamp sound(const Edit& edit, size_t place) {
    return chan(edit, AudioChan, place);
}

/// Changes an event of the channel with an index.
void setEvent(Edit& edit, int channel, const std::function<void(channel_event&)>& change) {
    cel& content = *edit.get_edit_cel_p(channel);
    channel_event event = *content.getChanEventPtr(0);
    change(event);
    ASSERT_TRUE(content.setEvent(0, event));
}

void addNodes(Edit& edit, int count) {
    AudLevelsCel levels = edit.getLevelsCel(edit.getAudCel(sound(edit, 0)).getLevelsChanID());
    for (int i = 0; i < count; ++i) {
        levels.insertNode(3.5 + i, 0.7F);
    }
}

struct Case {
    const char* what;
    std::function<void(Edit&)> change;
    const char* text;    ///< of `diff`; empty where nothing is told
    const char* pointer; ///< into the JSON
    nlohmann::json value;
};

const Case kCases[] = {
    {"a name", [](Edit& e) { e.setName("Reel 2"); },
     "header  changed; 1 key\n  - NAME  Reel\n  + NAME  Reel 2\n", "/header/0/before", "Reel"},
    {"a key that came", [](Edit& e) { e.Opts().setInt("TAKE", 3); }, "header  changed; 1 key\n  + TAKE  3\n",
     "/header/0/after", 3},
    {"a key that went", [](Edit& e) { e.Opts().remove("OWNER"); }, "  - OWNER  ", "/header/0/change",
     "removed"},
    {"a type alone", [](Edit& e) { e.Opts().setInt64("HIDDEN", 0); },
     "  - HIDDEN  0 (int)\n  + HIDDEN  0 (int64)\n", "/header/0/key", "HIDDEN"},
    {"a hostile text", [](Edit& e) { e.Opts().setString("NOTE", kNote + "\x1b[2J" + String(5000, 'y')); },
     "  - NOTE  …xxxxxxxxxxxx\n  + NOTE  …xxxxxxxxxxxx\\x1b[2Jyyy", "/header/0/key", "NOTE"},
    {"bookkeeping",
     [](Edit& e) {
         for (const char* key : {"MOD_COUNT", "MILESTONE", "CLIPBOARD_USED", "IS_BACKUP", "mod_time_v3"}) {
             e.Opts().setInt(key, 7);
         }
         e.Opts().setString("CHANGE_DESCRIPTION", "x");
         e.Opts().setString("MODIFICATION_PROGRAM", "x");
         e.Opts().setCookie("UNDO_COOKIE", cookie("E0002000"));
     },
     "", "/same", true},
    {"a group",
     [](Edit& e) {
         e.groupChannels({sound(e, 0), sound(e, 1)}, ChannelGroup::eStereo);
     },
     "groups  changed; 0 before, 1 after\n  + A1 A2  stereo\n", "/groups/added/0/channels/1", "A2"},
    {"a default group",
     [](Edit& e) {
         auto list = std::make_unique<ChannelGroupList>();
         list->addGroup({sound(e, 1), sound(e, 0)}, ChannelGroup::ePlain);
         e.objectStore().storeObject(ChannelGroupList::IdForDefaultGrouping, std::move(list));
     },
     "default groups  changed; 0 before, 1 after\n  + A2 A1\n", "/default_groups/added/0/type", 1},
    {"a node", [](Edit& e) { addNodes(e, 1); },
     "A1 levels  changed; nodes: 1 before, 2 after\n  + 00:00:03:13 (3.5 s)  level 0.7\n",
     "/levels/0/added/0/level", 0.7},
    {"many nodes", [](Edit& e) { addNodes(e, 50); }, "  level 0.7\n    38 more\n", "/levels/0/nodes_after",
     51},
    {"levels of their own", [](Edit& e) { (void)e.addLevelsChan(sound(e, 1), AudLevelsCel::create()); },
     "A2 levels  added; nodes: 0 before, 0 after\n", "/levels/0/change", "added"},
    {"a sync loss", [](Edit& e) { e.setSyncLoss(sound(e, 0), -0.5); },
     "A1  properties changed\n  + sync loss  -0.5 s\n", "/properties/0/values/0/after", -0.5},
    {"a channel's name", [](Edit& e) { e.setChanName(sound(e, 1), "Boom"); },
     "A2  properties changed\n  + name  Boom\n", "/properties/0/channel", "A2"},
    {"the name of levels", [](Edit& e) { e.setChanName(e.getAudCel(sound(e, 0)).getLevelsChanID(), "Ride"); },
     "A1 levels  properties changed\n  + name  Ride\n", "/properties/0/channel", "A1 levels"},
    {"what sound needs",
     [](Edit& e) {
         AudCel audio = e.getAudCel(sound(e, 0));
         audio.setSoundOutputEnabled(false);
         audio.setXFadesEnabled(true);
         e.setAudCel(audio);
     },
     "  + output  false\n  + cross fades  true\n", "/properties/0/values/1/property", "cross_fades"},
    {"material", [](Edit& e) { e.setMaterialInfo(sound(e, 0), "48k"); }, "  + material  48k\n",
     "/properties/0/values/0/property", "material"},
    {"a resolution", [](Edit& e) { e.get_edit_cel_p(1)->set_resolution(0.5); },
     "V1  properties changed\n  + resolution  0.5 s\n", "/properties/0/values/0/after", 0.5},
    {"an object",
     [](Edit& e) { e.objectStore().storeObject("Ext\xe2\x80\xae", std::make_unique<ChannelGroupList>()); },
     "object Ext\\u{202e}  added\n", "/objects/0/change", "added"},
    {"a clip's level", [](Edit& e) { setEvent(e, 3, [](channel_event& event) { event.level = 0.5F; }); },
     "M0001000 (level 0.5-1)\n", "/channels/0/added/0/level_in", 0.5},
    {"a fade's curve and a code",
     [](Edit& e) { setEvent(e, 1, [](channel_event& event) { event.rampCurve = 2, event.code = 9; }); },
     "M0001000 (curve 2-0) (code 9-0)\n", "/channels/0/added/0/curve_in", 2},
    {"what an effects channel shows",
     [](Edit& e) { setEvent(e, 0, [&](channel_event& event) { event.id = chan(e, VideoChan, 1); }); },
     "FX1  changed  00:00:00:00-00:00:04:00\n", "/channels/0/channel", "FX1"},
    {"a marker's length", [](Edit& e) { e.get_cues().get_cue_point(0, 0)->setSecondTime(2.0); },
     "cues  changed; 1 before, 1 after\n", "/cues/changed", true},
};

using QmeditDiff = Qmedit;

TEST_F(QmeditDiff, TellsWhatAnEditKeepsBesideItsPairs) {
    const auto written = [&](const char* where, const std::function<void(Edit&)>& change) {
        const String path = folder.path(where) + "/E0001000.qme";
        std::filesystem::remove_all(folder.path(where).c_str());
        std::filesystem::create_directories(folder.path(where).c_str());
        const EditPtr edit = edited(change);
        EXPECT_TRUE(edit->write_file(Qx::widen(path))) << edit->lastFileError();
        return path;
    };
    const String before = written("before", [](Edit&) {});
    for (const Case& its : kCases) {
        const String after = written("after", its.change);
        const test::ProgramResult text = run({"diff", before, after});
        ASSERT_EQ(text.code, 0) << its.what << ": " << text.err;
        const std::string told = *its.text == '\0' ? "the same\n" : its.text;
        EXPECT_NE(text.out.find(told), String::npos) << its.what << ":\n" << text.out;
        EXPECT_LT(text.out.size(), 1500u) << its.what;
        const auto json = nlohmann::json::parse(run({"diff", before, after, "--json"}).out);
        EXPECT_EQ(json.at("same"), *its.text == '\0') << its.what;
        const nlohmann::json::json_pointer pointer(its.pointer);
        EXPECT_EQ(json.contains(pointer) ? json.at(pointer) : json, its.value) << its.what;
        EXPECT_EQ(json.at("header").empty(), std::string_view(its.pointer).substr(0, 7) != "/header")
            << its.what << ": keys that mirror channels are told once";
        // The other way round a thing that came is one that went, and told of too.
        EXPECT_EQ(run({"diff", after, before}).out == "the same\n", *its.text == '\0') << its.what;
    }
}

} // namespace
