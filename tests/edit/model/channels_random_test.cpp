// Channels, groups, levels and cues of one edit come and go at random; beside it run plain lists that do the
// same the slow way. From time to time the edit is saved and read again.

#include "cues_groups/cue_fixture.h"
#include "edit/model/channel_group_list.h"
#include "support/edit_state.h"
#include "support/recording_log.h"
#include "support/temporary_folder.h"

#include <algorithm>
#include <gtest/gtest.h>
#include <random>
#include <set>

using Sub = Edit_Chan_SubType;

namespace {

class PlainEdit {
public:
    explicit PlainEdit(unsigned seed) : m_random(seed) {
        for (const int kind : {1, 1, 1, 2, 2, 2, 2, 2}) {
            insert(kind, 0, 1, true);
        }
    }

    void step(int number) {
        if (number % 30 == 29) {
            saveAndRead();
        }
        const IdStamp chan = m_chans[below(m_chans.size())].id;
        if (cel* const its = m_edit->getCel(chan)) {
            its->appendEventPair(test::source(number + 1), number, its->get_end_time() + 1, 1);
        }
        switch (below(9)) {
        case 0:
        case 1:
            insert(static_cast<int>(below(3)), static_cast<int>(below(m_chans.size() + 2)), 1 + below(3),
                   below(2) == 0);
            break;
        case 2:
        case 3:
            if (m_chans.size() > 8) {
                remove(chan);
            }
            break;
        case 4:
            addLevels(chan);
            break;
        case 5:
            removeFromGroup(chan);
            break;
        case 6:
            if (m_edit->ungroupChannels(chan)) {
                erase(find(chan));
            } else {
                EXPECT_EQ(find(chan), m_groups.size());
            }
            break;
        default:
            group();
        }
    }

    void check() const {
        ASSERT_EQ(m_edit->getNumChans(), static_cast<int>(m_chans.size()));
        for (size_t i = 0; i < m_chans.size(); ++i) {
            const int index = static_cast<int>(i);
            const IdStamp id = m_chans[i].id;
            ASSERT_EQ(m_edit->getId(index), id);
            ASSERT_EQ(m_edit->getIdx(id), index);
            ASSERT_EQ(m_edit->getChanTypeAndSubType(id), kTypes[m_chans[i].kind]);
            ASSERT_EQ(m_edit->getCel(id), m_edit->get_edit_cel_p(index));
            ASSERT_EQ(m_edit->getCel(id) == nullptr, m_chans[i].kind == 3);
            const IdStamp levels = m_edit->getAudCel(id).getLevelsChanID();
            ASSERT_TRUE(!levels.valid() || m_edit->getLevelsCel(levels).valid());
        }
        const ChannelGroupList& list = *m_edit->retrieveGroupsList();
        ASSERT_EQ(list.size(), m_groups.size());
        for (unsigned i = 0; i < list.size(); ++i) {
            Vector<IdStamp> members;
            list.getGroupContents(i, members);
            ASSERT_EQ(members, m_groups[i]);
        }
        // Every cue's text is the stamp of the channel that it was put on.
        ASSERT_EQ(m_edit->get_cues().get_num_cue_points(0), m_numCues);
        for (size_t i = 0; i < m_numCues; ++i) {
            const cue_point& cue = *m_edit->get_cues().get_cue_point(i, 0);
            ASSERT_EQ(cue.text(), m_edit->getId(cue.channel()).asString());
        }
    }

private:
    struct Channel {
        int kind; ///< 0 effects, 1 video, 2 audio, 3 levels
        IdStamp id;
    };
    static constexpr Edit::ChanType kTypes[] = {
        {VideoChan, Sub::ALIAS}, {VideoChan, Sub::NONE}, {AudioChan, Sub::NONE}, {}};

    size_t below(size_t n) { return m_random() % n; }

    void insert(int kind, int at, size_t number, bool before) {
        const auto isKind = [kind](const Channel& chan) { return chan.kind == kind; };
        const size_t most = kind == 0 ? 100 : kind == 1 ? 24 : 32;
        const bool fits =
            static_cast<size_t>(std::count_if(m_chans.begin(), m_chans.end(), isKind)) + number <= most;
        auto place = std::find_if(m_chans.begin(), m_chans.end(),
                                  [kind](const Channel& chan) { return chan.kind > kind; });
        const size_t wanted = static_cast<size_t>(before ? at : at + 1);
        if (static_cast<size_t>(at) < m_chans.size() && wanted < m_chans.size() &&
            m_chans[wanted].kind == kind) {
            place = m_chans.begin() + static_cast<ptrdiff_t>(wanted);
        }
        const int index = static_cast<int>(place - m_chans.begin());
        const test::RecordingLog quiet;
        ASSERT_EQ(m_edit->insertChans(kTypes[kind].type, kTypes[kind].subtype, at,
                                      static_cast<unsigned>(number), before, below(2) == 0, 0),
                  fits);
        for (int i = index; fits && i < index + static_cast<int>(number); ++i) {
            const IdStamp id = m_edit->getId(i);
            ASSERT_TRUE(m_seen.insert(id).second) << "a stamp twice";
            m_chans.insert(m_chans.begin() + i, {kind, id});
            m_edit->get_cues().add_cue_point(test::marker(id.asString().c_str(), i, i));
            ++m_numCues;
        }
    }
    void remove(const IdStamp& chan) {
        const IdStamp levels = m_edit->getAudCel(chan).getLevelsChanID();
        m_numCues -= m_edit->getCel(chan) != nullptr ? 1 : 0;
        ASSERT_TRUE(m_edit->removeChan(chan, below(2) == 0));
        std::erase_if(m_chans, [&](const Channel& its) {
            return its.id == chan || (levels.valid() && its.id == levels);
        });
        take(chan);
    }
    void addLevels(const IdStamp& chan) {
        const bool can = m_edit->getChanType(m_edit->getIdx(chan)) == AudioChan &&
                         !m_edit->getAudCel(chan).getLevelsChanID().valid();
        const IdStamp levels = m_edit->addLevelsChan(chan, AudLevelsCel::create());
        ASSERT_EQ(levels.valid(), can);
        if (can) {
            m_chans.push_back({3, levels});
        }
    }
    void removeFromGroup(const IdStamp& chan) {
        // The stamp may be the group's own.
        const size_t group = find(chan);
        const ChannelGroup* const its = m_edit->getTrackGroup(static_cast<unsigned>(group));
        ASSERT_EQ(
            m_edit->removeFromGroup(
                its != nullptr ? *std::find(its->getChans().begin(), its->getChans().end(), chan) : chan),
            group < m_groups.size());
        take(chan);
    }
    void group() {
        if (below(6) == 0 && !m_groups.empty()) {
            const auto again = static_cast<unsigned>(below(m_groups.size()));
            merge(Vector<IdStamp>(m_groups[again]));
            ASSERT_TRUE(
                m_edit->groupChannels(m_edit->getTrackGroup(again)->getChans(), ChannelGroup::ePlain));
            return;
        }
        Vector<IdStamp> chans;
        for (size_t n = 2 + below(4); n > 0; --n) {
            const Channel& chan = m_chans[below(m_chans.size())];
            chans.push_back(chan.kind == 3 ? m_chans[0].id : chan.id);
        }
        ASSERT_TRUE(m_edit->groupChannels(chans, ChannelGroup::ePlain));
        merge(chans);
    }
    void saveAndRead() {
        m_edit->set_cookie(cookie("E0001000"));
        m_edit->set_dirty(true);
        const WString path = Qx::widen(m_folder.path("E0001000.qme"));
        ASSERT_TRUE(m_edit->write_file(path)) << m_edit->lastFileError();
        const String before = test::contentState(*m_edit);
        m_edit = new Edit;
        ASSERT_EQ(m_edit->readFile(path, eOpenExisting), Edit::kReadOk) << m_edit->lastFileError();
        ASSERT_EQ(test::contentState(*m_edit), before);
    }

    [[nodiscard]] size_t find(const IdStamp& chan) const {
        size_t i = 0;
        while (i < m_groups.size() &&
               std::find(m_groups[i].begin(), m_groups[i].end(), chan) == m_groups[i].end()) {
            ++i;
        }
        return i;
    }
    void erase(size_t i) { m_groups.erase(m_groups.begin() + static_cast<std::ptrdiff_t>(i)); }
    void merge(const Vector<IdStamp>& chans) {
        Vector<IdStamp> members;
        for (const IdStamp& chan : chans) {
            const size_t i = find(chan);
            if (std::find(members.begin(), members.end(), chan) != members.end()) {
                continue;
            }
            const Vector<IdStamp> added = i < m_groups.size() ? m_groups[i] : Vector<IdStamp>{chan};
            members.insert(members.end(), added.begin(), added.end());
            if (i < m_groups.size()) {
                erase(i);
            }
        }
        if (members.size() > 1) {
            m_groups.push_back(members);
        }
    }
    void take(const IdStamp& chan) {
        if (const size_t i = find(chan); i < m_groups.size()) {
            std::erase(m_groups[i], chan);
            if (m_groups[i].size() < 2) {
                erase(i);
            }
        }
    }

    std::mt19937 m_random;
    test::TemporaryFolder m_folder;
    EditPtr m_edit{new Edit};
    std::vector<Channel> m_chans;
    std::vector<Vector<IdStamp>> m_groups;
    size_t m_numCues = 0;
    std::set<IdStamp> m_seen;
};

TEST(RandomChannels, AndGroupsAndCuesAgreeWithPlainLists) {
    for (unsigned seed = 1; seed <= 12; ++seed) {
        PlainEdit edit(seed);
        for (int i = 0; i < 400; ++i) {
            SCOPED_TRACE(testing::Message() << "seed " << seed << ", step " << i);
            ASSERT_NO_FATAL_FAILURE(edit.step(i));
            ASSERT_NO_FATAL_FAILURE(edit.check());
        }
    }
}

} // namespace
