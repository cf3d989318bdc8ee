#include "edit/model/managed_cel.h"
#include "edit/persist/detail/edit_file.h"

#include <algorithm>

namespace {

/// Marks a channel that has no number.
constexpr int kNoNumber = -1;

/// The cues of channel i come to be of channel `numbers[i]`. One whose channel has no number belongs to any
/// channel, follows nothing and stays at its time.
void renumberCues(cue_list& cues, const std::vector<int>& numbers) {
    for (size_t i = 0; i < cues.get_num_cue_points(0); ++i) {
        cue_point& cue = *cues.get_cue_point(i, 0);
        if (cue.channel() < 0 || cue.channel() >= std::ssize(numbers)) {
            continue;
        }
        const int number = numbers[static_cast<size_t>(cue.channel())];
        if (number != kNoNumber) {
            cue.setChannel(number);
        } else {
            cue.setChannel(kAnyCueChan);
            cue.detach();
        }
    }
}

/// The header keys that go by a channel's number.
constexpr struct {
    std::string_view name;
    bool isAudio; ///< by its old number, for audio channels
} kChannelKeys[] = {{EditKeys::kSyncLoss, false},
                    {EditKeys::kSyncError, true},
                    {EditKeys::kSoundOutput, true},
                    {EditKeys::kSoundOutputXFade, true}};

void renumberKeys(const Edit& edit, configb& header, const std::vector<EditFile::FileChannel>& file) {
    for (const auto& [name, isAudio] : kChannelKeys) {
        const configb before(header);
        EditKeys::removeNumbered(header, name, 0);
        int audio = 0;
        for (size_t i = 0; i < file.size(); ++i) {
            audio += file[i].isAudio ? 1 : 0;
            const configb::Value* const value =
                before.find(EditKeys::numbered(name, isAudio ? audio : static_cast<int>(i)));
            if (value != nullptr && file[i].id.valid() && (file[i].isAudio || !isAudio)) {
                const int number = isAudio ? EditFile::oldIndex(edit, file[i].id) : edit.getIdx(file[i].id);
                header.set(EditKeys::numbered(name, number), *value);
            }
        }
    }
}

} // namespace

void EditFile::renumber(Edit& edit, const std::vector<FileChannel>& file) {
    std::vector<int> numbers;
    bool same = true;
    for (const FileChannel& channel : file) {
        const int number = channel.id.valid() ? edit.getIdx(channel.id) : kNoNumber;
        same = same && number == std::ssize(numbers);
        numbers.push_back(number);
    }
    if (!same) {
        renumberCues(edit.m_cues, numbers);
        renumberKeys(edit, edit.m_header, file);
    }
}

void EditFile::renumberFor(const Edit& edit, const Vector<IdStamp>& order, cue_list& cues) {
    std::vector<int> numbers(static_cast<size_t>(edit.getNumChans()), kNoNumber);
    for (size_t i = 0; i < order.size(); ++i) {
        numbers[static_cast<size_t>(edit.getIdx(order[i]))] = static_cast<int>(i);
    }
    renumberCues(cues, numbers);
}

Vector<IdStamp> EditFile::storedChannels(const Edit& edit) {
    Vector<IdStamp> levels;
    Vector<IdStamp> audio;
    edit.getChans(audio, AudioChan);
    for (const IdStamp& chan : audio) {
        levels.push_back(edit.getAudCel(chan).getLevelsChanID());
    }
    Vector<IdStamp> stored;
    for (int i = 0; i < edit.getNumChans(); ++i) {
        const IdStamp chan = edit.getId(i);
        if (edit.getChanType(i) != NoChan || std::find(levels.begin(), levels.end(), chan) != levels.end()) {
            stored.push_back(chan);
        }
    }
    return stored;
}
