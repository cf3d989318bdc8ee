#pragma once

#include "edit/model/aud_levels_cel.h"
#include "edit/model/cel.h"
#include "edit/model/channel_group_list.h"
#include "edit/model/cue_list.h"
#include "edit/model/edit.h"
#include "edit/model/managed_cel.h"
#include "platform/services/files.h"
#include "platform/store/configb.h"
#include "platform/store/text_file.h"
#include "support/edit_state.h"

#include <algorithm>
#include <random>

namespace test {

inline constexpr const char* kItem = "E0001000";

/// A file's bytes; "(missing)" when it cannot be read.
inline String bytesOf(const String& path) {
    String text;
    return Qx::readWholeFile(path, text, uint64_t{1} << 30) ? String("(missing)") : text;
}

/// Everything that a file keeps of an edit, as text.
inline std::string stateOf(const Edit& edit) {
    TextFile header;
    edit.Opts().writeTo(header);
    String text = edit.get_cookie_str() + "\n" + header.text() + contentState(edit) +
                  String::format("entire %d\n", edit.get_entire_medium());
    for (int i = 0; i < edit.getNumChans(); ++i) {
        if (const cel* const content = edit.get_edit_cel_p(i)) {
            text += String::format("resolution %a\n", content->resolution());
        }
    }
    return text;
}

/// Appends pairs of varied events to a channel.
inline void addPairs(Edit& edit, int index, int pairs, std::mt19937& random) {
    cel& content = *edit.get_edit_cel_p(index);
    double time = content.get_end_time();
    for (int i = 0; i < pairs; ++i) {
        const double length = 0.04 * (1 + static_cast<double>(random() % 250));
        const cookie strip = random() % 10 == 0
                                 ? black_cookie
                                 : cookie(Cookie_Type::Material, static_cast<int>(random() % 200), 1);
        time += random() % 7 == 0 ? 0.04 : 0;
        content.appendEventPair(strip, 0.1 * static_cast<double>(random() % 1000), time, length);
        for (int at = content.numEvents() - 2; at < content.numEvents(); ++at) {
            channel_event event = content.get_event(at);
            event.level = static_cast<float>(random() % 1000) / 700.0F;
            event.velocity = random() % 5 == 0 ? -1.0 / 3 : 1;
            event.code = static_cast<int>(random());
            event.rampQFrames = static_cast<uint16_t>(random());
            event.rampCurve = static_cast<uint8_t>(random() % 4);
            content.setEvent(at, event);
        }
        time += length;
    }
}

/// A text that a person, another program or an enemy may have given: among them the words of files.
inline String anyText(std::mt19937& random) {
    static const char* const parts[] = {"",
                                        "roll 7",
                                        "CHANNEL_NAME ",
                                        "CHANNEL_NAME A1 x y SUBTYPE:NONE",
                                        "\n",
                                        "\r\n",
                                        "END_CHANNEL",
                                        "CUE_LIST_ENTRIES 3",
                                        "SUBTYPE:",
                                        " ",
                                        "%41\\x41 \\",
                                        "\xC3\x84\xE2\x82\xAC",
                                        "END_EDIT",
                                        "CEL_EVENTS 2",
                                        "\xEF\xBB\xBF"};
    String text;
    for (unsigned i = random() % 4; i > 0; --i) {
        text += parts[random() % std::size(parts)];
        text += random() % 3 == 0 ? String(1, static_cast<char>(random())) : String();
    }
    return text;
}

/// An edit of its own for each seed, with something of everything that a file keeps.
inline void fillAtRandom(Edit& edit, unsigned seed, int mostPairs = 6) {
    std::mt19937 random(seed);
    edit.set_cookie(cookie(kItem));
    for (unsigned i = 0; i < 1 + random() % 3; ++i) {
        edit.addChan(VideoChan, nullptr, false);
    }
    for (unsigned i = 0; i < random() % 5; ++i) {
        edit.addChan(AudioChan, nullptr, false);
    }
    for (unsigned i = 0; i < random() % 3; ++i) {
        edit.addChan(VideoChan, nullptr, false, Edit_Chan_SubType::ALIAS);
    }
    static const char* const names[] = {"",   "Ton links", "\xC3\x84\xE2\x82\xAC \xF0\x9F\x8E\xAC",
                                        "V1", "A%_x",      "Music 50% = a,b"};
    Vector<IdStamp> audio;
    for (int i = 0; i < edit.getNumChans(); ++i) {
        const IdStamp id = edit.getId(i);
        edit.setChanName(id, names[random() % 6]);
        edit.setMaterialInfo(id, anyText(random));
        edit.setSyncLoss(id, random() % 3 == 0 ? 0.125 * static_cast<double>(random() % 9) : 0);
        addPairs(edit, i,
                 static_cast<int>(random()) & 1
                     ? static_cast<int>(random() % (1u + static_cast<unsigned>(mostPairs)))
                     : 0,
                 random);
        if (edit.getChanType(i) == AudioChan) {
            audio.push_back(id);
        }
    }
    Vector<IdStamp> shuffled = audio;
    std::shuffle(shuffled.begin(), shuffled.end(), random);
    for (const IdStamp& id : shuffled) {
        AudCel channel = edit.getAudCel(id);
        channel.setSoundOutputEnabled(random() % 2 == 0);
        channel.setXFadesEnabled(random() % 2 == 0);
        edit.setAudCel(channel);
        if (random() % 2 == 0) {
            AudLevelsCel levels = AudLevelsCel::create();
            levels.insertNode(0.5, 0.25F);
            levels.insertNode(1.0 / 3, static_cast<float>(random() % 100) / 9);
            const IdStamp fader = edit.addLevelsChan(id, levels);
            edit.setChanName(fader, "fader");
            edit.setSyncLoss(fader, 0.125 * static_cast<double>(random() % 9));
        }
    }
    if (audio.size() > 1) {
        edit.groupChannels(audio, static_cast<ChannelGroup::eType>(1));
    }
    for (unsigned i = 0; i < random() % 4; ++i) {
        cue_point cue;
        cue.setText(anyText(random));
        cue.setEditTime(static_cast<double>(random() % 1000) / 7);
        cue.setSecondTime(cue.editTime());
        cue.setChannel(static_cast<int>(random() % 9));
        cue.setCode(static_cast<int>(random()));
        cue.setFlags(CueFlag::kKept | CueFlag::kInside);
        edit.get_cues().add_cue_point(cue);
    }
    edit.Opts().setString("a_text", "line\nend \\ \x01 \xE2\x82\xAC");
    edit.Opts().setDouble("a_double", 0.1 + static_cast<double>(random()) / 3);
    edit.Opts().setInt64("an_int64", int64_t{1} << 60);
    edit.Opts().setBool("a_bool", true);
    edit.Opts().setCookie("a_cookie", cookie("V0ABC0HZ"));
    edit.set_current_time(NO_CHAN, static_cast<double>(random() % 100) / 3);
    if (random() % 2 == 0) {
        edit.set_mark_time(NO_CHAN, 12.5);
    }
}

} // namespace test
