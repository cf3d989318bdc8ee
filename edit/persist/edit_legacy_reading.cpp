#include "edit/persist/detail/ed2_names.h"
#include "edit/persist/detail/edit_file.h"
#include "edit/persist/detail/legacy_upgrades.h"
#include "edit/persist/revision_history.h"
#include "platform/base/scanned_number.h"
#include "platform/services/files.h"
#include "platform/services/log.h"

#include <algorithm>

namespace {

constexpr std::string_view kCueSection = "CUE_LIST_ENTRIES ";
constexpr std::string_view kChannelLine = "CHANNEL_NAME ";
constexpr std::string_view kSubType = "SUBTYPE:";
// The fields of a channel line that carries a stamp, and the place of that stamp.
constexpr size_t kFieldsWithStamp = 4;
constexpr size_t kStampField = 2;

String atLine(int line, const String& what) {
    return String::format("line %d: ", line + 1) + what;
}

// The rate that the text names stands where the header's own is, so that the header keeps its order.
void putFrameRateBack(TextFile& file) {
    const int end = Ed2Names::headerEnd(file);
    const String start = String(EditKeys::kTvType) + ":textdata ";
    const int at = file.find(start, 0, true);
    if (at < 0 || at > end) {
        return;
    }
    const auto standard =
        Qx::Ed2Support::tvStdFromText(String(file[static_cast<unsigned>(at)].substr(start.size())).trimmed());
    if (standard.known()) {
        file.changeLine(static_cast<unsigned>(at),
                        String(EditKeys::kFrameRate) + ":int " + std::to_string(standard.frameRateCode));
    }
}

// One cue from its six lines. False when they are not those of a cue.
bool readCue(const TextFile& file, unsigned at, cue_point& cue) {
    const std::vector<String> lengths = file[at].split(' ', true);
    int length = 0;
    double time = 0;
    uint32_t flags = 0;
    int code = 0;
    int chan = 0;
    if (lengths.size() != 2 || !Qx::scanInt(lengths[0], length) || length < 0 ||
        !Qx::scanDouble(file[at + 2], time) || !Qx::scanHex(file[at + 3], flags) ||
        !Qx::scanInt(file[at + 4], code) || !Qx::scanInt(file[at + 5], chan)) {
        return false;
    }
    cue.setText(Ed2Names::cueName(file[at + 1], static_cast<size_t>(length)));
    cue.setFlags(static_cast<int>(flags));
    cue.setCode(code);
    cue.setChannel(chan);
    return cue.setEditTime(time) && cue.setSecondTime(time);
}

/// The cue section of a text. It stands between the header and the channels, whose texts may hold the words
/// that it begins with, and its own texts may hold those of a channel.
struct CueSection {
    unsigned stated = 0; ///< how many cues it should have
    unsigned after = 0;  ///< the line behind the last cue that reads; behind the header without a section
    cue_list cues;
};

CueSection readCueSection(const TextFile& file) {
    CueSection read;
    read.after = static_cast<unsigned>(Ed2Names::headerEnd(file) + 1);
    const int section = file.find(kCueSection, read.after);
    const int channel = file.find(kChannelLine, read.after, true);
    int count = 0;
    if (section < 0 || (channel >= 0 && channel < section)) {
        return read;
    }
    const auto at = static_cast<unsigned>(section);
    if (!Qx::scanInt(std::string_view(file[at]).substr(file[at].find(kCueSection) + kCueSection.size()),
                     count)) {
        return read;
    }
    constexpr unsigned kLinesPerCue = 6;
    read.stated = static_cast<unsigned>(std::max(count, 0));
    read.after = at + 1;
    for (unsigned i = 0; i < read.stated; ++i, read.after += kLinesPerCue) {
        cue_point cue;
        if (!readCue(file, read.after, cue)) {
            break;
        }
        read.cues.add_cue_point(cue);
    }
    return read;
}

} // namespace

bool Edit::readFromLegacyFile(const WString& path) {
    const Qx::Status status = EditFile::readLegacy(*this, Qx::narrow(path));
    if (!status) {
        EditFile::reset(*this);
        m_bad = true;
        return EditFile::fail(*this, status);
    }
    m_bad = false;
    m_fileStatus = {};
    return true;
}

Qx::Status EditFile::readLegacy(Edit& edit, const String& path) {
    TextFile file;
    if (Qx::Status loaded = file.load(path); !loaded) {
        return loaded;
    }
    const String refused = "cannot read " + path + ": ";
    if (file.numLines() == 0) {
        return Qx::Status::failure(Qx::StatusCode::Damaged, refused + "it is empty; export the edit again");
    }
    const Quiet quiet(edit);
    reset(edit);
    edit.m_initialising = true;
    edit.beginUpgrade(0);
    const Qx::Ed2Support::TVStd named = getNamedStandard(file);
    putFrameRateBack(file);
    unsigned after = 0;
    if (Qx::Status header = edit.m_header.buildFrom(file, 0, after); !header) {
        return Qx::Status::failure(Qx::StatusCode::Damaged,
                                   refused + "its header does not read, " + header.reason());
    }
    edit.clear_cache_flags();
    edit.redetermineLogType();
    edit.updateLegacyFormat(named);
    const RememberedFlags flags(edit);
    edit.set_ed2_revision(kCurrentEditRevision);

    Qx::Status status;
    if (!named.known()) {
        status =
            Qx::Status::failure(Qx::StatusCode::Damaged,
                                refused + "its tvtype names no television standard; write one such as pal "
                                          "in that line");
    } else {
        edit.readED2Cues(file);
        // The cues' channel numbers are those of the whole text: they do not move as its channels are added.
        const cue_list cues = edit.m_cues;
        edit.m_cues.delete_all_cues();
        std::vector<FileChannel> sections;
        status = readLegacyChannels(edit, file, sections);
        edit.m_cues = cues;
        renumber(edit, sections);
        if (!status) {
            status = status.retold(refused + status.reason());
        } else if (edit.getNumChans() == 0) {
            status = Qx::Status::failure(Qx::StatusCode::Damaged, refused + "it has no channels");
        } else {
            edit.updateLegacyFrameRate(named);
            edit.set_cookie(cookie(std::string_view(Qx::withoutExtension(Qx::fileNameOf(path)))));
            edit.convertCues();
            edit.m_load_edit_bits_from_header();
        }
    }
    flags.restore(edit);
    return status;
}

void Edit::readED2Cues(const TextFile& file) {
    const CueSection read = readCueSection(file);
    const size_t count = read.cues.get_num_cue_points(0);
    for (size_t i = 0; i < count; ++i) {
        m_cues.add_cue_point(*read.cues.get_cue_point(i, 0));
    }
    if (count < read.stated) {
        herc_printf("Edit::readED2Cues( %s ) - line %u begins no cue; %zu of %u were read\n",
                    get_cookie_str().c_str(), read.after + 1, count, read.stated);
    }
}

Qx::Status Edit::readED2Cels(const TextFile& file) {
    std::vector<EditFile::FileChannel> sections;
    return EditFile::readLegacyChannels(*this, file, sections);
}

Qx::Status EditFile::readLegacyChannels(Edit& edit, const TextFile& file,
                                        std::vector<FileChannel>& sections) {
    const int count = EditKeys::kNumChans.get(edit.m_header);
    unsigned next = readCueSection(file).after;
    while (std::ssize(sections) < count) {
        const int found = file.find(kChannelLine, next);
        if (found < 0) {
            break;
        }
        const auto at = static_cast<unsigned>(found);
        next = at + 1;
        FileChannel& section = sections.emplace_back();
        const std::vector<String> fields = file[at].split(' ', true);
        if (file[at].starts_with(kSubType) || fields.size() < 2) {
            continue;
        }
        auto content = std::make_unique<cel>();
        // The texts of a channel's lines may hold the words that the next one begins with.
        const Qx::Status built = content->buildFrom(file, next, &next);
        const Edit_Chan_Type type = Edit::edit_chan_type_from_name(fields[1].front());
        if (type != VideoChan && type != AudioChan) {
            LogBoth("Edit::readED2Cels() encountered unknown track type\n");
            continue;
        }
        if (!built) {
            return built;
        }
        if (Qx::Status added = addLegacyChannel(edit, type, fields, std::move(content), section.id); !added) {
            return added.retold(atLine(found, added.reason()));
        }
        section.isAudio = type == AudioChan;
    }
    return {};
}

Qx::Status EditFile::addLegacyChannel(Edit& edit, Edit_Chan_Type type, const std::vector<String>& fields,
                                      std::unique_ptr<cel> content, IdStamp& added) {
    if (type == VideoChan &&
        edit.getNumChans(VideoChan, Edit_Chan_SubType::NONE) >= static_cast<int>(kMaxVideoChans)) {
        return Qx::Status::failure(Qx::StatusCode::Damaged, "too many video channels; remove that section");
    }
    const int index = edit.addChan(type, content.get(), false);
    if (index == NO_CHAN) {
        return Qx::Status::failure(Qx::StatusCode::Damaged,
                                   "the channel cannot be added; remove that section");
    }
    const String material = content.release()->editChannelMaterialInfo();
    if (fields.size() == kFieldsWithStamp) {
        edit.setChannelID(edit.getId(index), IdStamp(std::string_view(fields[kStampField])));
    }
    added = edit.getId(index);
    edit.setMaterialInfo(added, material);
    const String name = Ed2Names::channelName(fields[1]);
    if (type == AudioChan && name != edit.getChanDisplayName(added)) {
        edit.setChanName(added, name);
    }
    return {};
}
