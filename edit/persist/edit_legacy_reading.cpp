#include "edit/persist/detail/ed2_names.h"
#include "edit/persist/detail/edit_file.h"
#include "edit/persist/detail/legacy_upgrades.h"
#include "edit/persist/revision_history.h"
#include "platform/services/files.h"
#include "platform/services/log.h"

#include <charconv>
#include <cmath>

namespace {

constexpr std::string_view kCueSection = "CUE_LIST_ENTRIES ";
constexpr std::string_view kChannelLine = "CHANNEL_NAME ";
constexpr std::string_view kSubType = "SUBTYPE:";
// The fields of a channel line that carries a stamp, and the place of that stamp.
constexpr size_t kFieldsWithStamp = 4;
constexpr size_t kStampField = 2;

String atLine(int line, const char* what) {
    return String::format("line %d: %s", line + 1, what);
}

// The rate that the text names stands where the header's own is, so that the header keeps its order.
void putFrameRateBack(TextFile& file) {
    const int end = file.find(EditKeys::kHeaderEnd, 0, true);
    const String start = String(EditKeys::kTvType) + ":textdata ";
    const int at = file.find(start, 0, true);
    if (at < 0 || at > end) {
        return;
    }
    const auto standard = Qx::Ed2Support::tvStdFromText(file[static_cast<unsigned>(at)].substr(start.size()));
    if (standard.known()) {
        file.changeLine(static_cast<unsigned>(at),
                        String(EditKeys::kFrameRate) + ":int " + std::to_string(standard.frameRateCode));
    }
}

bool readFlags(const String& text, int& flags) {
    uint32_t word = 0;
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), word, 16);
    flags = static_cast<int>(word);
    return error == std::errc() && end == text.data() + text.size();
}

// One cue from its six lines. False when they are not those of a cue.
bool readCue(const TextFile& file, unsigned at, cue_point& cue) {
    const std::vector<String> lengths = file[at].split(' ', true);
    int length = 0;
    double time = 0;
    int flags = 0;
    int code = 0;
    int chan = 0;
    if (lengths.size() != 2 || !Qx::textToInt(lengths[0], length) || length < 0 ||
        !Qx::textToDouble(file[at + 2], time) || !readFlags(file[at + 3], flags) ||
        !Qx::textToInt(file[at + 4], code) || !Qx::textToInt(file[at + 5], chan)) {
        return false;
    }
    cue.setText(Ed2Names::cueName(file[at + 1], static_cast<size_t>(length)));
    cue.setFlags(flags);
    cue.setCode(code);
    cue.setChannel(chan);
    return cue.setEditTime(time) && cue.setSecondTime(time);
}

} // namespace

bool Edit::readFromLegacyFile(const WString& path) {
    const Qx::Status status = EditFile::readLegacy(*this, Qx::narrow(path));
    if (!status) {
        EditFile::reset(*this);
        m_bad = true;
        return EditFile::fail(*this, status.reason());
    }
    m_bad = false;
    m_fileError.clear();
    return true;
}

Qx::Status EditFile::readLegacy(Edit& edit, const String& path) {
    TextFile file;
    if (Qx::Status loaded = file.load(path); !loaded) {
        return loaded;
    }
    const String refused = "cannot read " + path + ": ";
    if (file.numLines() == 0) {
        return Qx::Status::failure(refused + "it is empty; export the edit again");
    }
    const Quiet quiet(edit);
    reset(edit);
    edit.m_initialising = true;
    const Qx::Ed2Support::TVStd named = LegacyUpgrades::getNamedStandard(file);
    putFrameRateBack(file);
    unsigned after = 0;
    if (Qx::Status header = edit.m_header.buildFrom(file, 0, after); !header) {
        return Qx::Status::failure(refused + "its header does not read, " + header.reason());
    }
    edit.clear_cache_flags();
    edit.redetermineLogType();
    LegacyUpgrades::updateLegacyFormat(edit, named);
    const LegacyUpgrades::RememberedFlags flags(edit);
    edit.set_ed2_revision(kCurrentEditRevision);

    Qx::Status status;
    if (!named.known()) {
        status =
            Qx::Status::failure(refused + "its tvtype names no television standard; write one such as pal "
                                          "in that line");
    } else {
        edit.readED2Cues(file);
        // The cues' channel numbers are those of the whole edit: they do not move as its channels are added.
        const cue_list cues = edit.m_cues;
        edit.m_cues.delete_all_cues();
        status = edit.readED2Cels(file);
        edit.m_cues = cues;
        if (!status) {
            status = Qx::Status::failure(refused + status.reason());
        } else if (edit.getNumChans() == 0) {
            status = Qx::Status::failure(refused + "it has no channels");
        } else {
            LegacyUpgrades::updateLegacyFrameRate(edit, named);
            edit.set_cookie(cookie(std::string_view(Qx::withoutExtension(Qx::fileNameOf(path)))));
            edit.convertCues();
            edit.m_load_edit_bits_from_header();
        }
    }
    flags.restore(edit);
    return status;
}

namespace {

/// The first line behind the header, whose texts may hold the words that sections begin with; 0 without one.
unsigned behindHeader(const TextFile& file) {
    return static_cast<unsigned>(file.find(EditKeys::kHeaderEnd, 0, true) + 1);
}

} // namespace

void Edit::readED2Cues(const TextFile& file) {
    const int section = file.find(kCueSection, behindHeader(file));
    int count = 0;
    if (section < 0 ||
        !Qx::textToInt(std::string_view(file[static_cast<unsigned>(section)])
                           .substr(std::min(kCueSection.size(), file[static_cast<unsigned>(section)].size())),
                       count)) {
        return;
    }
    constexpr unsigned kLinesPerCue = 6;
    auto at = static_cast<unsigned>(section) + 1;
    for (int i = 0; i < count; ++i, at += kLinesPerCue) {
        cue_point cue;
        if (!readCue(file, at, cue)) {
            herc_printf("Edit::readED2Cues( %s ) - line %u begins no cue; %d of %d were read\n",
                        get_cookie_str().c_str(), at + 1, i, count);
            return;
        }
        m_cues.add_cue_point(cue);
    }
}

Qx::Status Edit::readED2Cels(const TextFile& file) {
    const int count = m_header.getInt(EditKeys::kNumChans);
    int at = static_cast<int>(behindHeader(file)) - 1;
    for (int sections = 0; sections < count; ++sections) {
        at = file.find(kChannelLine, static_cast<unsigned>(at + 1));
        if (at < 0) {
            break;
        }
        const String& line = file[static_cast<unsigned>(at)];
        const std::vector<String> fields = line.split(' ', true);
        if (line.starts_with(kSubType) || fields.size() < 2) {
            continue;
        }
        const Edit_Chan_Type type = edit_chan_type_from_name(fields[1].front());
        if (type != VideoChan && type != AudioChan) {
            LogBoth("Edit::readED2Cels() encountered unknown track type\n");
            continue;
        }
        if (type == VideoChan &&
            getNumChans(VideoChan, Edit_Chan_SubType::NONE) >= static_cast<int>(kMaxVideoChans)) {
            return Qx::Status::failure(atLine(at, "too many video channels; remove that section"));
        }
        auto content = std::make_unique<cel>();
        if (Qx::Status built = content->buildFrom(file, static_cast<unsigned>(at) + 1); !built) {
            return built;
        }
        const int index = addChan(type, content.release(), false);
        if (index == NO_CHAN) {
            return Qx::Status::failure(atLine(at, "the channel cannot be added; remove that section"));
        }
        if (fields.size() == kFieldsWithStamp) {
            setChannelID(getId(index), IdStamp(std::string_view(fields[kStampField])));
        }
        const IdStamp chan = getId(index);
        setMaterialInfo(chan, get_edit_cel_p(index)->editChannelMaterialInfo());
        const String name = Ed2Names::channelName(fields[1]);
        if (type == AudioChan && name != getChanDisplayName(chan)) {
            setChanName(chan, name);
        }
    }
    return {};
}
