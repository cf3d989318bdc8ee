#include "edit/persist/detail/legacy_upgrades.h"

#include "edit/model/aud_levels_cel.h"
#include "edit/model/ce_handle.h"
#include "edit/model/cel.h"
#include "edit/model/edit.h"
#include "platform/media/frame_rate.h"
#include "platform/services/log.h"

#include <optional>
#include <stdexcept>

namespace {

// The nodes that the ramps of one audio channel become, and the node that the next one continues from.
class RampsToNodes {
public:
    RampsToNodes(Edit& edit, const IdStamp& audio)
        : m_edit(edit), m_audio(audio), m_quarterFrame(Qx::projectFrameRate().frameDuration() * 0.25) {}

    /// How many ramps there were.
    int convert(cel& content) {
        for (int i = 0; i + 1 < content.numEvents(); i += 2) {
            const channel_event in = content.get_event(i);
            const channel_event out = content.get_event(i + 1);
            if (out.editTime - in.editTime <= 0) {
                break;
            }
            if (in.level != out.level) {
                ramp(in, out);
                ++m_converted;
                ce_handle(&content, i).set_strip_level(1);
                ce_handle(&content, i + 1).set_strip_level(1);
            } else if (m_levels.valid() && m_last) {
                flatAfterRamp(in.editTime);
            }
        }
        if (m_levels.valid()) {
            m_levels.simplify();
            m_edit.init_dirty();
        }
        return m_converted;
    }

private:
    void ramp(const channel_event& in, const channel_event& out) {
        double time = in.editTime;
        if (!m_levels.valid()) {
            const IdStamp id = m_edit.addLevelsChan(m_audio, AudLevelsCel::create());
            m_levels = m_edit.getLevelsCel(id);
            if (!m_levels.valid()) {
                throw std::logic_error("a levels channel could not be added");
            }
        }
        if (!m_last && time != 0) {
            insert(time, 1);
        }
        if (m_last) {
            makeRoom(time, lastLevel() > in.level);
        }
        insert(time, in.level);
        insert(out.editTime, out.level);
    }

    void flatAfterRamp(double time) {
        if (lastLevel() != 1.0F) {
            makeRoom(time, lastLevel() >= 1.0F);
            insert(time, 1);
        }
        m_last.reset();
    }

    // A step of the level takes a quarter frame: the louder side gives it.
    void makeRoom(double& time, bool moveLast) {
        if (!moveLast) {
            time += m_quarterFrame;
        } else if (const double at = m_levels.getNodeStore()[*m_last].time;
                   !m_levels.changeNodeStore().moveNode(*m_last, at - m_quarterFrame)) {
            throw std::logic_error("two ramps lie within a quarter frame");
        }
    }

    void insert(double time, float level) { m_last = m_levels.changeNodeStore().insertNode(time, level); }
    [[nodiscard]] float lastLevel() const { return m_levels.getNodeStore()[*m_last].level; }

    Edit& m_edit;
    IdStamp m_audio;
    double m_quarterFrame;
    AudLevelsCel m_levels;
    std::optional<size_t> m_last;
    int m_converted = 0;
};

bool hasLevelsTracks(const Edit& edit) {
    for (int i = 0; i < edit.getNumChans(); ++i) {
        if (edit.getLevelsCel(edit.getId(i)).valid()) {
            return true;
        }
    }
    return false;
}

} // namespace

void Edit::removeShotSoundRamps() {
    if (hasLevelsTracks(*this)) {
        return;
    }
    Vector<IdStamp> chans;
    getChans(chans, AudioChan);
    int converted = 0;
    try {
        for (const IdStamp& chan : chans) {
            if (cel* content = getCel(chan)) {
                converted += RampsToNodes(*this, chan).convert(*content);
            }
        }
    } catch (const std::logic_error& error) {
        LogBoth("Failed converting audio levels, %s\n", error.what());
        noteNotUpgraded("removeShotSoundRamps", String("some level ramps stay: ") + error.what());
    }
    if (converted > 0) {
        noteUpgrade(countedText(converted, "level ramp", " became nodes of levels channels"));
    }
}
