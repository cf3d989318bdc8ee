#include "tests/edit/editing/editing_fixture.h"

#include <cmath>

using namespace test;
using Qx::kNoTime;
using Qx::MarkTypes::InMark;
using Qx::MarkTypes::OutMark;
using Range = EditModule::Range;

namespace {

const Range kNoRegion = Editable::invalidRange();

class EditModuleTest : public EditingTest {
protected:
    EditPtr m_edit = make({"E EE", "V AAAABBB", "V CCCCCCC", "A DDDDDDD"});
    EditModule m_module{m_edit};
    IdStamp chan(int index) { return m_edit->getId(index); }
};

TEST_F(EditModuleTest, OfWhatDoesNotOpenIsEmpty) {
    EditModule empty(cookie(Cookie_Type::Edit, 999, 9), 1, 2, 3);
    EXPECT_FALSE(empty.getEdit().valid());
    EXPECT_EQ(empty.getMarkTime(InMark), kNoTime);
    EXPECT_EQ(empty.getMarkTime(chan(1), OutMark), kNoTime);
    EXPECT_EQ(empty.getMarkedRegion(EditModule::ExactTimes), kNoRegion);
    EXPECT_EQ(empty.getSourceRegion(EditModule::ExactTimes), kNoRegion);
    EXPECT_FALSE(empty.isSelected(chan(1)));
    EXPECT_EQ(empty.getNumSelectedChans(), 0u);
    empty.selectAll(false);
    EXPECT_EQ(empty.numRecords(), 0u);
}

TEST_F(EditModuleTest, RegionsOfTwoMarksAndACurrentTime) {
    struct Case {
        double in;
        double out;
        double current;
        Range region;
    };
    for (const Case& its :
         {Case{kNoTime, kNoTime, 3, kNoRegion}, Case{5, 5, 8, {5, 8}}, Case{9, kNoTime, 3, {3, 9}},
          Case{kNoTime, 9, 3, {3, 9}}, Case{7, 2, 4, {2, 7}}, Case{1, 4, 9, {1, 4}}}) {
        EXPECT_EQ(EditModule::getMarkedRegion(its.in, its.out, its.current, EditModule::ExactTimes),
                  its.region);
    }
    EXPECT_EQ(EditModule::getMarkedRegion(1.01, 3.03, 0, EditModule::WholeFrames), Range(1.0, 3.04));
    EXPECT_EQ(EditModule::getMarkedRegion(1.01, 3.03, 0, static_cast<EditModule::Mode>(0)), Range(1.0, 3.04));
}

TEST_F(EditModuleTest, RecordsAreOnlyOfTheDeselectedAndTheMarked) {
    EXPECT_EQ(m_module.numRecords(), 0u);
    EXPECT_EQ(m_module.getNumSelectedChans(), 4u);
    m_module.selectChan(chan(1), false);
    EXPECT_EQ(m_module.numRecords(), 1u);
    EXPECT_FALSE(m_module.isSelected(chan(1)));
    EXPECT_EQ(m_module.getNumSelectedChans(VideoChan, Edit_Chan_SubType::NONE), 1u);
    m_module.selectChan(chan(1), true);
    EXPECT_EQ(m_module.numRecords(), 0u);

    m_module.setMarkTime(chan(2), 4, InMark);
    m_module.selectChan(chan(2), false);
    EXPECT_FALSE(m_module.isMarked()); // of the selected ones
    EXPECT_TRUE(m_module.isMarked(chan(2)));
    EXPECT_EQ(m_module.getMarkedRegion(EditModule::ExactTimes), kNoRegion);
    m_module.selectChan(chan(2), true);
    EXPECT_EQ(m_module.numRecords(), 1u);
    m_module.clearMarks(chan(2));
    EXPECT_EQ(m_module.numRecords(), 0u);
    m_module.setMarkTime(chan(1), std::nan(""), InMark);
    m_module.selectChan(IdStamp(1, 2, 3), false);
    m_module.setMarkTime(IdStamp(1, 2, 3), 4, InMark);
    EXPECT_EQ(m_module.numRecords(), 0u);
}

TEST_F(EditModuleTest, MarkingAllWithTheUnsetTimeClearsWhatIsSelected) {
    m_module.markAllAt(Range(1, 2));
    m_module.selectChan(chan(3), false);
    m_module.markAllAt(kNoTime, InMark);
    EXPECT_EQ(m_module.getMarkTimes(chan(1)), std::pair(kNoTime, 2.0));
    EXPECT_EQ(m_module.getMarkTimes(chan(3)), std::pair(1.0, 2.0));
    m_module.markAllAt(kNoTime, OutMark);
    EXPECT_EQ(m_module.numRecords(), 1u);
}

TEST_F(EditModuleTest, TheModulesRegionCoversThoseOfItsChannels) {
    m_module.setCurTime(6);
    m_module.setMarkTime(chan(1), Range(2, 3));
    m_module.setMarkTime(chan(3), 5, InMark);
    EXPECT_EQ(m_module.getMarkedRegion(EditModule::ExactTimes), Range(2, 6));
    EXPECT_EQ(m_module.getMarkTime(InMark), 2);
    EXPECT_EQ(m_module.getMarkTime(OutMark), 3);
    // Places: reversed marks in order, then those of the others, then the current time.
    m_module.setMarkTime(chan(1), std::pair(8.0, 4.0));
    EXPECT_EQ(m_module.getMarkedPlace(chan(1), InMark), 4);
    EXPECT_EQ(m_module.getMarkedPlace(chan(3), OutMark), 8);
    EXPECT_EQ(m_module.getMarkedPlace({}, InMark), 4);
    EXPECT_EQ(EditModule(m_edit).getMarkedPlace({}, InMark), m_edit->get_current_time());
}

TEST_F(EditModuleTest, SourceRegionsAreTimesOfTheMaterial) {
    cel& its = *m_edit->get_edit_cel_p(1);
    its.set_strip_time(its.get_start_ceh(), 100); // A plays from 100 s on
    m_module.selectChan(chan(0), false);
    m_module.setMarkTime(chan(1), Range(1, 3));
    EXPECT_EQ(m_module.getSourceRegion(chan(1), EditModule::ExactTimes), Range(101, 103));
    EXPECT_EQ(m_module.getSourceRegion(EditModule::ExactTimes), Range(101, 103));
    m_module.setMarkTime(chan(1), Range(3, 5)); // over a cut: no one span of material
    EXPECT_EQ(m_module.getSourceRegion(chan(1), EditModule::ExactTimes), kNoRegion);
    EXPECT_EQ(m_module.getSourceRegion(EditModule::ExactTimes), Range(3, 5)); // C plays through
    EXPECT_EQ(m_module.getSourceRegion(chan(2), EditModule::ExactTimes), kNoRegion);
}

TEST_F(EditModuleTest, SimilarMarksAndSelectionsGoToCorrespondingChannels) {
    const EditPtr other = editOf({"V ", "A ", "A "});
    EditModule theirs(other);
    theirs.setCurTime(20);
    theirs.markAllAt(Range(50, 60));
    m_module.setMarkTime(chan(1), Range(2, 4));
    m_module.setMarkTime(chan(2), Range(1, 6)); // no second video channel there
    m_module.setMarkTime(chan(3), 3, OutMark);
    m_module.setCurTime(1);

    EditModule::makeSimilarMarks(m_module, theirs, 10);
    EXPECT_EQ(theirs.getMarkTimes(other->getId(0)), std::pair(11.0, 13.0));
    EXPECT_EQ(theirs.getMarkTimes(other->getId(1)), std::pair(kNoTime, 12.0));
    EXPECT_FALSE(theirs.isMarked(other->getId(2)));
    EditModule::makeSimilarMarks(m_module, theirs, kNoTime);
    EXPECT_EQ(theirs.getMarkTimes(other->getId(0)), std::pair(21.0, 23.0));

    m_module.selectChan(chan(1), false);
    EditModule::makeSimilarTrackSelections(m_module, theirs);
    Vector<IdStamp> selected;
    theirs.getSelectedChans(selected);
    EXPECT_EQ(selected, Vector<IdStamp>{other->getId(1)});
    EXPECT_TRUE(theirs.isMarked(other->getId(0))); // deselected, still marked
}

TEST_F(EditModuleTest, VerifyDropsTheRecordsOfChannelsThatAreGone) {
    m_module.selectChan(chan(1), false);
    m_module.selectChan(chan(2), false);
    m_edit->removeChan(chan(1), false);
    m_module.verify();
    EXPECT_EQ(m_module.numRecords(), 1u);
}

TEST_F(EditModuleTest, AudioIsPreparedOnceAndOnlyWhereItIsSelected) {
    const EditPtr edit = make({"V AAAAA", "A BBB", "A CC"}, 101);
    edit->get_edit_cel_p(1)->get_start_ceh().set_strip_level(0.5F);
    EditModule module(edit);
    module.selectChan(edit->getId(2), false);
    EXPECT_EQ(autoInitAudioTracks(module), 1u);
    EXPECT_EQ(drawRows(*edit), (Rows{"V AAAAA", "A BBB..", "A CC"}));
    EXPECT_EQ(autoInitAudioTracks(module), 0u);
    EXPECT_EQ(autoInitAudioLevelsTracks(module), 1u);
    const AudLevelsCel levels = edit->getLevelsCel(edit->getAudCel(edit->getId(1)).getLevelsChanID());
    EXPECT_DOUBLE_EQ(levels.getNodeStore().levelAt(0), 0.5); // those of its clip
    EXPECT_EQ(autoInitAudioLevelsTracks(module), 0u);
    edit->set_read_only(true);
    module.selectAll(true);
    EXPECT_EQ(autoInitAudioTracks(module), 0u);
    EXPECT_EQ(autoInitAudioLevelsTracks(module), 0u);
}

} // namespace
