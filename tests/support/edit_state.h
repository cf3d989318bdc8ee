#pragma once

#include "edit/model/aud_levels_cel.h"
#include "edit/model/cel.h"
#include "edit/model/cue_list.h"
#include "edit/model/edit.h"
#include "edit/model/managed_cel.h"
#include "platform/store/configb.h"

#include <variant>

namespace test {

inline String valueText(const configb::Value& value) {
    struct Text {
        String operator()(int32_t v) const { return std::to_string(v); }
        String operator()(int64_t v) const { return std::to_string(v) + "L"; }
        String operator()(double v) const { return Qx::doubleToText(v) + "s"; }
        String operator()(const String& v) const { return "\"" + v + "\""; }
        String operator()(const cookie& v) const { return "<" + v.asString() + ">"; }
        String operator()(bool v) const { return v ? "yes" : "no"; }
    };
    return std::visit(Text(), value);
}

inline String eventText(const channel_event& event) {
    return String::format("    %c %s %s v%s l%s c%d %s %s q%u/%u\n", event.kind == CE_IN_POINT ? '[' : ']',
                          Qx::doubleToText(event.editTime).c_str(), Qx::doubleToText(event.stripTime).c_str(),
                          Qx::doubleToText(event.velocity).c_str(),
                          Qx::doubleToText(static_cast<double>(event.level)).c_str(), event.code,
                          event.strip.asString().c_str(), event.id.asString().c_str(),
                          unsigned{event.rampQFrames}, unsigned{event.rampCurve});
}

/// One channel with all that belongs to it, a line an event.
inline String channelState(const Edit& edit, int index) {
    const IdStamp chan = edit.getId(index);
    String text =
        String::format("  %d %s type %u/%u name \"%s\" shown \"%s\" material \"%s\" sync %s\n", index,
                       chan.asString().c_str(), static_cast<unsigned>(edit.getChanType(index)),
                       static_cast<unsigned>(edit.getChanSubtype(index)), edit.getChanName(chan).c_str(),
                       edit.getChanDisplayName(chan).c_str(), edit.getMaterialInfo(chan).c_str(),
                       Qx::doubleToText(edit.getSyncLoss(chan)).c_str());
    if (const AudCel audio = edit.getAudCel(chan); audio.valid()) {
        text += String::format("    levels %s output %d cross-fades %d\n",
                               audio.getLevelsChanID().asString().c_str(),
                               audio.getSoundOutputEnabled() ? 1 : 0, audio.getXFadesEnabled() ? 1 : 0);
    }
    if (const cel* const its = edit.get_edit_cel_p(index)) {
        for (int i = 0; i < its->numEvents(); ++i) {
            text += eventText(its->get_event(i));
        }
    }
    if (const AudLevelsCel levels = edit.getLevelsCel(chan); levels.valid()) {
        for (const auto& node : levels.getNodeStore().nodes()) {
            text += "    node " + Qx::doubleToText(node.time) + " " +
                    Qx::doubleToText(static_cast<double>(node.level)) + "\n";
        }
    }
    return text;
}

/// Channels, groups, cues and times: what the user sees as the edit, without its header and its dirt.
inline String contentState(const Edit& edit) {
    String text = "time " + Qx::doubleToText(edit.get_current_time()) + " mark " +
                  Qx::doubleToText(edit.get_mark_time()) + "\n";
    for (int i = 0; i < edit.getNumChans(); ++i) {
        text += channelState(edit, i);
    }
    for (unsigned i = 0; i < edit.numGroups(); ++i) {
        text += String::format("  group %u:", static_cast<unsigned>(edit.getTrackGroup(i)->getType()));
        for (const IdStamp& chan : edit.getTrackGroup(i)->getChans()) {
            text += " " + chan.asString();
        }
        text += "\n";
    }
    for (size_t i = 0; i < edit.get_cues().get_num_cue_points(0); ++i) {
        const cue_point& cue = *edit.get_cues().get_cue_point(i, 0);
        text +=
            String::format("  cue \"%s\" at %s chan %d code %d flags %d\n", cue.text().c_str(),
                           Qx::doubleToText(cue.editTime()).c_str(), cue.channel(), cue.code(), cue.flags());
    }
    return text;
}

/// Everything that can be asked of an edit, as text: two edits, or one before and after, are alike when their
/// texts are.
inline String editState(const Edit& edit) {
    String text = "edit " + edit.get_cookie_str() + (edit.get_dirty() ? " dirty" : " clean") +
                  (edit.isDirty(true) ? " deep" : "") + "\n";
    for (const String& key : edit.Opts().keys()) {
        text += "  " + key + " = " + valueText(*edit.Opts().find(key)) + "\n";
    }
    return text + contentState(edit);
}

} // namespace test
