#include "edit/manager/edit_record.h"

#include "edit/material/log_attributes.h"
#include "platform/media/time_def.h"
#include "platform/services/current_project.h"

namespace {

int flagsOf(const Edit& edit, edit_log_type_t type) {
    int flags = edit.get_hidden() != 0 ? kRecordHidden : 0;
    switch (type) {
    case kLogGhost3:
        flags |= kRecordGhost3;
        break;
    case kLogGhost4:
        flags |= kRecordGhost4;
        break;
    case kLogGhost5:
        flags |= kRecordGhost5;
        break;
    case kLogGhost6:
        flags |= kRecordGhost6;
        break;
    default:
        break;
    }
    return flags;
}

String chansOf(const Edit& edit) {
    const unsigned video = edit.getNumChans(VideoChan, Edit_Chan_SubType::NONE);
    const unsigned audio = edit.getNumChans(AudioChan);
    const unsigned effects = edit.getNumChans(VideoChan, Edit_Chan_SubType::ALIAS);
    String text;
    const auto add = [&text](char one, char several, unsigned count) {
        if (count > 0) {
            text += (count > 1 ? several : one) + std::to_string(count);
        }
    };
    add('V', 'V', video);
    add('a', 'A', audio);
    add('f', 'F', effects);
    return text;
}

/// The form of times in the records of the current project.
time_def recordTimes() {
    const Qx::CurrentProject project = Qx::currentProject();
    return {Qx::FrameRate(project.frameRateCode), project.dropFrame};
}

/// The columns of the log attributes that an edit's own header and labels tell, the name apart.
struct LogColumn {
    LogAttribute attribute;
    projdb::Column column;
};
constexpr LogColumn kLogColumns[] = {
    {LogAttribute::kDate, projdb::Date},
    {LogAttribute::kScene, projdb::Scene},
    {LogAttribute::kShot, projdb::Shot},
    {LogAttribute::kWho, projdb::Who},
    {LogAttribute::kDescription, projdb::Description},
    {LogAttribute::kNotes, projdb::Notes},
    {LogAttribute::kCookie, projdb::Cookie},
    {LogAttribute::kReel, projdb::Reel},
    {LogAttribute::kSoundStart, projdb::SoundStart},
    {LogAttribute::kSoundReel, projdb::SoundReel},
    {LogAttribute::kAudioQuality, projdb::AudioQuality},
    {LogAttribute::kCompressionFormat, projdb::CompressionFormat},
    {LogAttribute::kFrameOrigin, projdb::FrameOrigin},
    {LogAttribute::kPulldown, projdb::Pulldown},
    {LogAttribute::kSequence, projdb::Sequence},
    {LogAttribute::kStart24PCode, projdb::Start24PCode},
    {LogAttribute::kEnd24PCode, projdb::End24PCode},
    {LogAttribute::k24PReel, projdb::Reel24P},
    {LogAttribute::kStartKeycode, projdb::StartKeycode},
    {LogAttribute::kEndKeycode, projdb::EndKeycode},
    {LogAttribute::kStartCamcode, projdb::StartCamcode},
    {LogAttribute::kEndCamcode, projdb::EndCamcode},
    {LogAttribute::kCamReel, projdb::CamReel},
    {LogAttribute::kCamDate, projdb::CamDate},
    {LogAttribute::kLabReel, projdb::LabReel},
    {LogAttribute::kCompReel, projdb::CompReel},
    {LogAttribute::kStartInkcode, projdb::StartInkcode},
    {LogAttribute::kEndInkcode, projdb::EndInkcode},
    {LogAttribute::kSourceFormat, projdb::SourceFormat},
    {LogAttribute::kReelType, projdb::ReelType},
    {LogAttribute::kFilmDuration, projdb::FilmDuration},
};

} // namespace

projdb::Record editRecordOf(const Edit& edit, const Qx::FileInfo* file) {
    projdb::Record record;
    const edit_log_type_t type = edit.get_log_type();
    const double start = edit.getStartTime();
    const double end = edit.getEndTime();
    record[projdb::Type] = Edit::log_type_string_get_ms(type);
    record[projdb::Flags] = std::to_string(flagsOf(edit, type));
    record[projdb::Chans] = chansOf(edit);
    record[projdb::StartTime] = recordTimes().asString(start);
    record[projdb::EndTime] = recordTimes().asString(end);
    record[projdb::Name] = edit.getAttribute(LogAttribute::kName);
    record[projdb::Rate] = edit.getFrameRate().asString();
    record[projdb::Duration] = Qx::doubleToText(end - start);
    record[projdb::NumChans] = std::to_string(edit.getNumChans());
    record[projdb::Created] = std::to_string(edit.getCreationTime());
    record[projdb::Modified] = std::to_string(edit.getModificationTime());
    record[projdb::Owner] = edit.getOwner();
    for (const LogColumn& row : kLogColumns) {
        record[row.column] = edit.getAttribute(row.attribute);
    }
    if (file != nullptr) {
        stampRecord(record, *file);
    }
    return record;
}

void stampRecord(projdb::Record& record, const Qx::FileInfo& file) {
    record[projdb::FileSize] = std::to_string(file.size);
    record[projdb::FileTime] = std::to_string(file.modifiedNs);
}

bool isRecordOfFile(const projdb::Record& record, const Qx::FileInfo& file) {
    return record[projdb::FileSize] == std::to_string(file.size) &&
           record[projdb::FileTime] == std::to_string(file.modifiedNs);
}

double recordTime(const String& text) {
    return recordTimes().seconds(text);
}
