#pragma once

#include "edit/model/aud_levels_cel.h"
#include "edit/model/cel.h"
#include "edit/model/edit.h"

#include <cmath>
#include <vector>

namespace test {

/// Makes edits of a given shape, clean: channels in index order, each with the same row of clips.
///
///     EditPtr edit = EditBuilder().effects(1).video(2).audio(2).levels(2).clips({2, -1, 3}).build();
class EditBuilder {
public:
    EditBuilder& effects(unsigned count) { return m_effects = count, *this; }
    EditBuilder& video(unsigned count) { return m_video = count, *this; }
    EditBuilder& audio(unsigned count) { return m_audio = count, *this; }
    /// Levels for the first `count` audio channels, one node each.
    EditBuilder& levels(unsigned count) { return m_levels = count, *this; }
    /// Lengths in seconds, one clip after the other; one below zero is black of that length. Clip k plays
    /// "M0001000" and so on, from 10 k seconds.
    EditBuilder& clips(std::vector<double> lengths) { return m_clips = std::move(lengths), *this; }
    EditBuilder& item(const cookie& item) { return m_item = item, *this; }

    [[nodiscard]] EditPtr build() const {
        EditPtr edit(new Edit);
        edit->set_cookie(m_item);
        add(*edit, m_effects, VideoChan, Edit_Chan_SubType::ALIAS);
        add(*edit, m_video, VideoChan, Edit_Chan_SubType::NONE);
        add(*edit, m_audio, AudioChan, Edit_Chan_SubType::NONE);
        Vector<IdStamp> audio;
        edit->getChans(audio, AudioChan);
        for (unsigned i = 0; i < m_levels && i < audio.size(); ++i) {
            AudLevelsCel levels = AudLevelsCel::create();
            levels.insertNode(i + 1.0, 0.5F);
            levels.setChanged(false);
            (void)edit->addLevelsChan(audio[i], levels, false);
        }
        edit->set_dirty(false);
        return edit;
    }

private:
    void add(Edit& edit, unsigned count, Edit_Chan_Type type, Edit_Chan_SubType subtype) const {
        for (unsigned i = 0; i < count; ++i) {
            cel* const content = edit.get_edit_cel_p(edit.addChan(type, nullptr, false, subtype));
            double time = 0;
            for (size_t k = 0; k < m_clips.size() && content != nullptr; ++k) {
                const double length = m_clips[k];
                const cookie strip =
                    length < 0 ? black_cookie : cookie(Cookie_Type::Material, static_cast<int>(k + 1), 0);
                content->appendEventPair(strip, 10.0 * static_cast<double>(k), time, std::abs(length));
                time += std::abs(length);
            }
            if (content != nullptr) {
                content->setChanged(false);
            }
        }
    }

    unsigned m_effects = 0;
    unsigned m_video = 0;
    unsigned m_audio = 0;
    unsigned m_levels = 0;
    std::vector<double> m_clips;
    cookie m_item{Cookie_Type::Edit, 42, 1};
};

} // namespace test
