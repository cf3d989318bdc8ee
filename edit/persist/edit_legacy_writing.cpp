#include "edit/persist/detail/ed2_names.h"
#include "edit/persist/detail/edit_file.h"
#include "platform/media/frame_rate.h"
#include "platform/services/current_project.h"
#include "platform/services/log.h"

namespace {

// Puts a line in the place of the one that begins with `start`, or before the end of the header.
void putHeaderLine(TextFile& file, std::string_view start, const String& line) {
    const int at = file.find(start, 0, true);
    if (at >= 0) {
        file.changeLine(static_cast<unsigned>(at), line);
        return;
    }
    file.changeLine(file.numLines() - 1, line);
    file.appendLine(EditKeys::kHeaderEnd);
}

void removeFirstLine(TextFile& file, std::string_view start) {
    if (const int at = file.find(start, 0, true); at >= 0) {
        file.removeLine(static_cast<unsigned>(at));
    }
}

// The cookie by which legacy texts name the effect of a graph. Effects are known by their graph alone here,
// so there is none.
cookie getED2CookieForED5Effect(const IdStamp& /*graph*/) {
    return invalid_cookie;
}

// A copy of an edit's video for the text, in which effects have the cookies that the text knows.
std::unique_ptr<cel> withLegacyEffects(const Edit& edit, const cel& content) {
    std::unique_ptr<cel> copy = content.copy();
    int unknown = 0;
    for (int i = 0; i < copy->numEvents(); ++i) {
        channel_event event = copy->get_event(i);
        if (!event.strip.isEffectGraph()) {
            continue;
        }
        const cookie effect = getED2CookieForED5Effect(event.id);
        if (effect.is_valid()) {
            event.strip = effect;
            copy->setEvent(i, event);
        } else {
            ++unknown;
        }
    }
    if (unknown > 0) {
        herc_printf("Edit::writeED2Cels( %s ) - %d events show effects that the text has no name for\n",
                    edit.get_cookie_str().c_str(), unknown);
    }
    return copy;
}

} // namespace

Vector<IdStamp> EditFile::legacyChannels(const Edit& edit) {
    Vector<IdStamp> chans;
    const int video = edit.getFirstChan(VideoChan, Edit_Chan_SubType::NONE);
    if (video == NO_CHAN || !edit.getId(video).valid()) {
        return chans;
    }
    chans.push_back(edit.getId(video));
    edit.getChans(chans, AudioChan);
    return chans;
}

bool Edit::writeToLegacyFile(const WString& path) {
    const String name = Qx::narrow(path);
    TextFile file;
    const Qx::Ed2Support::TVStd standard = writeED2Config(file);
    if (!standard.known()) {
        herc_printf("Edit::writeToLegacyFile( %s ) - legacy text has no name for the project's frame rate; "
                    "it cannot be read again\n",
                    get_cookie_str().c_str());
    }
    writeED2Cues(file);
    const unsigned written = writeED2Cels(file, standard);
    if (written == 0 && m_cookie != Qx::currentProject().project) {
        return EditFile::fail(*this,
                              Qx::Status::failure(Qx::StatusCode::Unsupported,
                                                  "cannot write " + name + ": edit " + get_cookie_str() +
                                                      " has no video channel, which a legacy text needs"));
    }
    const Qx::Status status = file.save(name);
    if (!status) {
        return EditFile::fail(*this, status);
    }
    m_fileStatus = {};
    return true;
}

Qx::Ed2Support::TVStd Edit::writeED2Config(TextFile& file) const {
    configb header(m_header);
    const Vector<IdStamp> chans = EditFile::legacyChannels(*this);
    EditFile::updateHeader(*this, header, chans);
    // These tell of the objects of an object store; the standard is written below.
    EditKeys::removeNumbered(header, EditKeys::kCelKind, 0);
    EditKeys::removeNumbered(header, EditKeys::kLevels, 0);
    EditKeys::removeNumbered(header, EditKeys::kLevelsName, 0);
    EditKeys::removeNumbered(header, EditKeys::kLevelsPlace, 0);
    EditKeys::removeNumbered(header, EditKeys::kLevelsUnread, 0);
    header.remove(EditKeys::kTvType);
    header.writeTo(file);

    for (int at = 0; (at = file.find("CHANNEL_MAP", static_cast<unsigned>(at), true)) >= 0;) {
        file.removeLine(static_cast<unsigned>(at));
    }
    removeFirstLine(file, String(EditKeys::kUndoCookie) + ":");
    removeFirstLine(file, String(EditKeys::kRedoCookie) + ":");
    for (int at = -1; (at = file.find(String(EditKeys::kLabel), static_cast<unsigned>(at + 1), true)) >= 0;) {
        const String line = file[static_cast<unsigned>(at)];
        const int comma = line.nthIndex(1, ',');
        if (line.find("LABEL_REV:") != String::npos && comma >= 0) {
            file.changeLine(static_cast<unsigned>(at), String(line.substr(0, static_cast<size_t>(comma))));
        }
    }
    const String numChans = String(EditKeys::kNumChans) + ":int ";
    putHeaderLine(file, numChans, numChans + std::to_string(getNumChans(AudioChan) + 1));
    const String standard = Qx::Ed2Support::tvStdTextForProject();
    putHeaderLine(file, String(EditKeys::kFrameRate) + ":int ",
                  String(EditKeys::kTvType) + ":textdata " + standard);
    return Qx::Ed2Support::tvStdFromText(standard);
}

void Edit::writeED2Cues(TextFile& file) const {
    cue_list cues = m_cues;
    EditFile::renumberFor(*this, EditFile::legacyChannels(*this), cues);
    const size_t count = cues.get_num_cue_points(CueFlag::kKept);
    file.appendLine("CUE_LIST_ENTRIES " + std::to_string(count));
    for (size_t i = 0; i < count; ++i) {
        // By design the first `count` cues of the whole list: kept cues stand first.
        const cue_point& cue = *cues.get_cue_point(i, 0);
        file.appendLine(std::to_string(cue.text().size()) + " 0");
        file.appendLine(Ed2Names::cueLine(cue.text()));
        file.appendLine(Qx::doubleToText(cue.editTime()));
        file.appendLine(String::format("%08x", static_cast<unsigned>(cue.flags())));
        file.appendLine(std::to_string(cue.code()));
        file.appendLine(std::to_string(cue.channel()));
    }
}

unsigned Edit::writeED2Cels(TextFile& file, Qx::Ed2Support::TVStd standard) const {
    const Vector<IdStamp> chans = EditFile::legacyChannels(*this);
    unsigned written = 0;
    for (const IdStamp& chan : chans) {
        const Qx::Ptr<cel> content = contentOf(chan);
        if (content == nullptr) {
            continue;
        }
        const bool video = getChanType(chan) == VideoChan;
        const String name = video ? String("V") : Ed2Names::channelField(getChanDisplayName(chan));
        file.appendLine("CHANNEL_NAME " + name + " " + chan.asString() + " SUBTYPE:NONE");
        // The material text is the channel's, which its cel holds only after a save.
        std::unique_ptr<cel> copy =
            video && get_log_type() == kLogEdit ? withLegacyEffects(*this, *content) : content->copy();
        copy->editChannelInfo(String(), chan, subTypeText(Edit_Chan_SubType::NONE), getMaterialInfo(chan));
        copy->writeToED2(file, standard);
        file.appendLine("END_CHANNEL");
        ++written;
    }
    if (!chans.empty()) {
        file.appendLine("END_EDIT");
    }
    return written;
}
