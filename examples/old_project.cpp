// Makes a project as an earlier version of the editor would have left it: edits of older revisions, with level
// ramps, key numbers, rolls and the frame rates of old standards. "qmedit upgrade --project FOLDER" brings it up
// to date. Build it with find_package(quillmarch_edit REQUIRED) and link quillmarch::edit.
//
//     old_project FOLDER

#include <cstdio>
#include <edit/manager/session.h>
#include <edit/model/ce_handle.h>
#include <edit/model/cel.h>
#include <edit/model/edit.h>
#include <platform/media/edit_label.h>
#include <platform/store/configb.h>

namespace {

const cookie kTake("E0001000");
const cookie kScene("E0002000");
const cookie kReel("E0003000");
const cookie kCopy("E0004000");

Qx::FrameRate rate(int code) {
    return Qx::FrameRate(code);
}

/// A clip of the take on a channel; its level goes from `from` to `to`.
void lay(Edit& edit, int chan, double strip, double at, double length, float from = 1, float to = 1) {
    cel& content = *edit.get_edit_cel_p(chan);
    content.appendEventPair(kTake, strip, at, length);
    ce_handle(&content, content.numEvents() - 2).set_strip_level(from);
    ce_handle(&content, content.numEvents() - 1).set_strip_level(to);
}

/// Film of 24 frames a second, 100 s long, with its key number, its 24-frame timecode and its rolls.
void fillTake(Edit& edit) {
    edit.addChan(VideoChan, nullptr, false);
    edit.get_edit_cel_p(0)->appendEventPair(cookie("M0001000"), 0, 0, 100);
    configb& header = edit.Opts();
    header.setInt("ORIGINAL_MATERIAL", 1);
    header.setString("slate/take", "12A/3");
    header.setString("scene", "12A");
    header.setString("reelid", "A001");
    header.setString("tvtype", "pal_24");
    label key;
    static_cast<void>(label::parse("KJ 12 3456 7890+12",
                                   label::Scale::film(kKeyKodeLabelType, FilmGauge::Film35mm4Perf), key)
                          .isOk());
    const Qx::FrameRate film = rate(Qx::FrameRate::Fps24);
    const label code(label::Scale::timecode(film), film.toFrames(3600));
    label feet;
    static_cast<void>(
        label::parse("20+00", label::Scale::film(kFootFrameLabelType, FilmGauge::Film35mm4Perf), feet)
            .isOk());
    header.setInt("numLabels_", 3);
    header.setString("LABEL0", edit_label({kCameraMedium, 1}, key, 0, film).make_keep_string());
    // An older number of the medium of 24 frames.
    header.setString("LABEL1", edit_label({kLegacy24Medium, 1}, code, 0, film).make_keep_string());
    header.setString("LABEL2", edit_label({kLabMedium, 1}, feet, 0, film).make_keep_string());
    header.setInt("NUM_MEDIUMROLLS", 2);
    header.setString("MEDIUMROLL0", MediumRoll({kCameraMedium, 1}, "A001").asString());
    header.setString("MEDIUMROLL1", MediumRoll({kLabMedium, 1}, "L7").asString());
}

/// A scene whose sound fades by ramps in the clips, with a hidden effects channel and grouped channels.
void fillScene(Edit& edit) {
    edit.setName("Scene 12");
    edit.addChan(VideoChan, nullptr, false);
    edit.addChan(AudioChan, nullptr, false);
    edit.addChan(AudioChan, nullptr, false);
    edit.addChan(VideoChan, nullptr, false, Edit_Chan_SubType::ALIAS);
    lay(edit, 1, 10, 0, 4);
    lay(edit, 1, 30, 4, 4);
    lay(edit, 2, 10, 0, 4, 0.0F, 1.0F);
    lay(edit, 2, 30, 4, 4, 1.0F, 0.25F);
    lay(edit, 3, 10, 0, 8);
    edit.Opts().setString("CHAN_GRPS", "A1A2");
}

/// A reel that was counted in 30 frames a second, which stood for 29.97.
void fillReel(Edit& edit) {
    edit.setName("Reel 1");
    edit.setFrameRate(rate(Qx::FrameRate::Fps30));
    edit.addChan(VideoChan, nullptr, false);
    lay(edit, 0, 0, 0, 10);
    lay(edit, 0, 20, 10, 50);
}

/// A copy of the take that was cut once.
void fillCopy(Edit& edit) {
    edit.addChan(VideoChan, nullptr, false);
    lay(edit, 0, 0, 0, 5, 0.5F, 1.0F);
    edit.Opts().setInt("ORIGINAL_MATERIAL", 1);
    edit.Opts().setInt("is_dupe", 1);
}

struct OldEdit {
    cookie item;
    int revision;
    void (*fill)(Edit& edit);
};

} // namespace

int main(int argc, char** argv) {
    if (argc != 2) {
        std::fprintf(stderr, "usage: old_project FOLDER\n");
        return 2;
    }
    Session session(argv[1]);
    if (const Qx::Status opened = session.open(); !opened) {
        std::fprintf(stderr, "%s\n", opened.reason().c_str());
        return 1;
    }
    const OldEdit edits[] = {
        {kTake, 290, fillTake}, {kScene, 210, fillScene}, {kReel, 400, fillReel}, {kCopy, 500, fillCopy}};
    for (const OldEdit& old : edits) {
        const EditPtr edit(new Edit);
        edit->set_cookie(old.item);
        old.fill(*edit);
        edit->set_ed2_revision(old.revision);
        if (!edit->write_file()) {
            std::fprintf(stderr, "%s\n", edit->lastFileError().c_str());
            return 1;
        }
        std::printf("%s: revision %d\n", old.item.asString().c_str(), old.revision);
    }
    return 0;
}
