#include "interchange/legacy_text.h"

#include "edit/model/aud_levels_cel.h"
#include "edit/model/cue_list.h"
#include "edit/model/edit.h"
#include "edit/model/edit_keys.h"
#include "platform/media/tv_standard.h"
#include "platform/services/current_project.h"
#include "platform/services/files.h"

namespace interchange {

namespace {

void reportChannels(const Edit& edit, LossReport& report) {
    bool pictureSeen = false;
    for (int chan = 0; chan < edit.getNumChans(); ++chan) {
        const IdStamp id = edit.getId(chan);
        const String shown = "channel " + edit.getChanDisplayName(id);
        if (edit.getLevelsCel(id).valid()) {
            report.addLoss(0, shown + ": its levels are not written");
        } else if (edit.getChanSubtype(chan) != Edit_Chan_SubType::NONE) {
            report.addLoss(0, shown + " is left out: the text holds no effects channels");
        } else if (edit.getChanType(chan) == VideoChan) {
            if (pictureSeen) {
                report.addLoss(0, shown + " is left out: the text holds one video channel");
            }
            pictureSeen = true;
        }
    }
}

void reportLosses(const Edit& edit, LossReport& report) {
    reportChannels(edit, report);
    for (unsigned i = 0; i < edit.numGroups(); ++i) {
        const ChannelGroup* const group = edit.getTrackGroup(i);
        if (group != nullptr && group->size() > 0) {
            report.addLoss(0, "channel group " + edit.getGroupDisplayName(group->getChans()[0], true) +
                                  " is not written");
        }
    }
    const cue_list& cues = edit.get_cues();
    const size_t kept = cues.get_num_cue_points(CueFlag::kKept);
    for (size_t i = 0; i < cues.get_num_cue_points(0); ++i) {
        const cue_point& cue = *cues.get_cue_point(i, 0);
        if (i >= kept && cue.hasFlags(CueFlag::kKept)) {
            report.addLoss(0, "cue \"" + cue.text() +
                                  "\" stands behind cues that are not kept and is not written");
        }
    }
    const auto standard = Qx::Ed2Support::tvStdFromText(Qx::Ed2Support::tvStdTextForProject());
    if (edit.getFrameRate().code() != standard.frameRateCode) {
        report.addLoss(0, "the edit's " + edit.getFrameRate().asString() +
                              " frames a second are not written: the text states the project's " +
                              Qx::FrameRate(standard.frameRateCode).asString());
    }
}

} // namespace

Qx::Status exportLegacyText(Edit& edit, bool strict, const String& path, LossReport& report) {
    if (Qx::Ed2Support::tvStdTextForProject().empty()) {
        return Qx::Status::failure("legacy text has no name for the project's " +
                                   Qx::projectFrameRate().asString() +
                                   " frames a second and could not be read again; export an EDL instead");
    }
    reportLosses(edit, report);
    if (const size_t losses = report.losses().size(); strict && losses > 0) {
        return Qx::Status::failure(
            String::format("%zu loss%s; without the strict mode the text is made all the same", losses,
                           losses == 1 ? "" : "es"));
    }
    if (!edit.writeToLegacyFile(Qx::widen(path))) {
        return edit.lastFileStatus();
    }
    return {};
}

Qx::Status importLegacyText(const String& path, Import& result) {
    const WString wide = Qx::widen(path);
    if (getEditFileTypeFromFileName(wide) != kLegacyTextFile) {
        return Qx::Status::failure(path + ": legacy text is known by the extension .ed2; rename the file");
    }
    EditPtr read(new Edit(wide, eOpenExisting));
    if (read->isBad()) {
        return read->lastFileStatus();
    }
    // An item of its own in the project that it comes to.
    read->set_cookie(provisionalCookie(0));
    configb& header = read->Opts();
    EditKeys::kBackup.set(header, 0);
    EditKeys::kUndoCookie.set(header, invalid_cookie);
    EditKeys::kRedoCookie.set(header, invalid_cookie);
    EditKeys::kProjectCookie.set(header, Qx::currentProject().project);
    read->init_dirty();
    Import made;
    made.report.setFile(Qx::fileNameOf(path));
    made.sequence = read;
    result = std::move(made);
    return {};
}

} // namespace interchange
