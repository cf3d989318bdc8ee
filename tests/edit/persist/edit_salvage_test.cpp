#include "edit/persist/edit_salvage.h"

#include "edit/model/edit.h"
#include "platform/store/object_store_info.h"
#include "support/edit_builder.h"
#include "support/edit_state.h"
#include "support/recording_log.h"
#include "support/temporary_folder.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <filesystem>
#include <sys/stat.h>

namespace {

/// The file of an edit with something of everything, and copies of it with damage.
class DamagedFile : public testing::Test {
protected:
    DamagedFile() {
        EditPtr made = test::EditBuilder().effects(1).video(2).audio(2).levels(2).clips({2, -1, 3}).build();
        Vector<IdStamp> audio;
        made->getChans(audio, AudioChan);
        for (int i = 0; i < 5; ++i) {
            made->setSyncLoss(made->getId(i), 0.25 * (i + 1));
        }
        AudCel boom = made->getAudCel(audio[1]);
        boom.setSoundOutputEnabled(false);
        made->setAudCel(boom);
        made->setName("Harbour");
        made->setChanName(audio[1], "Boom");
        made->groupChannels(audio, ChannelGroup::ePlain);
        made->get_cues().add_cue_point(cue_point("ship", 1.0, kAnyCueChan, 2, {}, false));
        made->set_undo_cookie(cookie(Cookie_Type::Edit, 7, 0));
        made->set_dirty(true);
        m_name = made->get_cookie_str() + ".qme";
        EXPECT_TRUE(made->write_file(Qx::widen(m_folder.path(m_name)))) << made->lastFileError();
        m_bytes = m_folder.read(m_name);
        m_channels = made->getNumChans();
        std::vector<StoredObjectInfo> objects;
        String damage;
        EXPECT_TRUE(examineStore(m_folder.path(m_name), objects, damage).isOk());
        m_objects = objects;
    }

    /// Salvages bytes under a name of their own; the file must stay as it is.
    bool salvage(const std::string& bytes) {
        const String path = m_folder.write("copy of it.qme.bad", bytes);
        lost.clear();
        edit.invalidate();
        const Qx::Status status = salvageEdit(path, edit, lost);
        reason = status.reason();
        EXPECT_EQ(m_folder.read("copy of it.qme.bad"), bytes);
        return status.isOk();
    }
    [[nodiscard]] const StoredObjectInfo& object(const String& name) const {
        return *std::find_if(m_objects.begin(), m_objects.end(),
                             [&](const StoredObjectInfo& info) { return info.name == name; });
    }
    [[nodiscard]] std::string without(const String& name) const {
        std::string bytes = m_bytes;
        const StoredObjectInfo& info = object(name);
        bytes[info.offset + info.length - 1] ^= 0x20;
        return bytes;
    }
    [[nodiscard]] std::vector<String> faultsOf(const std::string& bytes) const {
        std::vector<String> faults;
        verifyEditFile(m_folder.write(m_name, bytes), faults);
        return faults;
    }
    [[nodiscard]] String lostText() const {
        String text;
        for (const String& line : lost) {
            text += line + "\n";
        }
        return text;
    }

    test::RecordingLog m_log;
    test::TemporaryFolder m_folder;
    String m_name;
    std::string m_bytes;
    int m_channels = 0;
    std::vector<StoredObjectInfo> m_objects;
    EditPtr edit;
    std::vector<String> lost;
    String reason;
};

} // namespace

TEST_F(DamagedFile, ASoundFileIsSavedWhole) {
    ASSERT_TRUE(salvage(m_bytes)) << reason;
    EXPECT_EQ(lostText(), "");
    EditPtr read(new Edit);
    ASSERT_EQ(read->readFile(Qx::widen(m_folder.path(m_name)), eOpenExisting), Edit::kReadOk);
    EXPECT_EQ(test::contentState(*edit), test::contentState(*read));
    EXPECT_EQ(edit->getName(), "Harbour");
    EXPECT_FALSE(edit->get_cookie().is_valid());
    EXPECT_FALSE(edit->get_undo_cookie().is_valid());
    EXPECT_TRUE(edit->get_dirty());
}

TEST_F(DamagedFile, OneDamagedObjectCostsThatObject) {
    const struct {
        const char* object;
        int channels; ///< that are lost with it
        const char* lost;
    } cases[] = {
        {"EditHeader", 2, "the header: "}, // the levels are paired there
        {"CueId", 0, "the cues: "},
        {"Celid0", 1, "a video or effects channel (object Celid0)"},
        {"Celid2", 1, "a video or effects channel (object Celid2)"},
        {"Celid3", 2, "channel A1 (object Celid3)"}, // with its levels
        {"Celid4", 2, "channel A2 (with a name of its own) (object Celid4)"},
        {"ChannelGroupList", 0, "the channel groups: "},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.object);
        ASSERT_TRUE(salvage(without(c.object))) << reason;
        EXPECT_EQ(edit->getNumChans(), m_channels - c.channels) << lostText();
        EXPECT_NE(lostText().find(c.lost), String::npos) << lostText();
        EXPECT_EQ(edit->get_cues().get_num_cue_points(0), c.object == std::string("CueId") ? 0U : 1U);
        // What belongs to a channel stays with it.
        if (const IdStamp boom = edit->getChanWithName("Boom");
            boom.valid() && c.object != std::string("EditHeader")) {
            EXPECT_EQ(edit->getSyncLoss(boom), 1.25);
            EXPECT_FALSE(edit->getAudCel(boom).getSoundOutputEnabled());
        }
        for (unsigned i = 0; i < edit->numGroups(); ++i) {
            for (const IdStamp& member : edit->getTrackGroup(i)->getChans()) {
                EXPECT_TRUE(edit->chanValid(member)) << "a group without its lost channels";
            }
        }
        // What is saved is an edit that reads again.
        edit->set_cookie(cookie(Cookie_Type::Edit, 99, 0));
        edit->init_dirty();
        const String path = m_folder.path("E002R000.qme");
        ASSERT_TRUE(edit->write_file(Qx::widen(path))) << edit->lastFileError();
        EditPtr read(new Edit);
        ASSERT_EQ(read->readFile(Qx::widen(path), eOpenExisting), Edit::kReadOk) << read->lastFileError();
        EXPECT_EQ(std::string(test::contentState(*read)), std::string(test::contentState(*edit)));
    }
}

TEST_F(DamagedFile, WithoutItsHeaderTheKindsOfItsChannelsAreKept) {
    ASSERT_TRUE(salvage(without("EditHeader"))) << reason;
    EXPECT_EQ(edit->getNumChans(VideoChan, Edit_Chan_SubType::ALIAS), 1);
    EXPECT_EQ(edit->getNumChans(VideoChan, Edit_Chan_SubType::NONE), 2);
    EXPECT_EQ(edit->getNumChans(AudioChan), 2) << lostText();
    EXPECT_TRUE(edit->getChanWithName("Boom").valid());
    EXPECT_NE(lostText().find("channel \"Boom\": its kind is lost with the header"), String::npos)
        << lostText();
}

TEST_F(DamagedFile, AFileThatWasCutOffGivesWhatIsInFrontOfTheCut) {
    const uint64_t third = object("Celid2").offset;
    ASSERT_TRUE(salvage(m_bytes.substr(0, third + 10))) << reason;
    EXPECT_GE(edit->getNumChans(), 2) << lostText();
    EXPECT_NE(lostText().find("Celid1 is doubtful"), String::npos) << lostText();
    ASSERT_TRUE(salvage(m_bytes.substr(0, m_bytes.size() - 1))) << reason;
    EXPECT_EQ(edit->getNumChans(), m_channels) << lostText();
    EXPECT_EQ(edit->getName(), "Harbour");
    // No length of a file does harm.
    size_t saved = 0;
    for (size_t size = 0; size < m_bytes.size(); size += 23) {
        saved += salvage(m_bytes.substr(0, size)) ? 1U : 0U;
        EXPECT_EQ(edit.valid(), reason.empty());
    }
    EXPECT_GT(saved, m_bytes.size() / 23 / 2);
}

TEST_F(DamagedFile, EveryFlippedByteIsFoundAndCostsLittle) {
    ASSERT_TRUE(faultsOf(m_bytes).empty()) << faultsOf(m_bytes).front();
    for (size_t at = 0; at < m_bytes.size(); at += at < 128 ? 1 : 13) {
        std::string bytes = m_bytes;
        bytes[at] ^= 0x41;
        EXPECT_FALSE(faultsOf(bytes).empty()) << "byte " << at;
        EditPtr read(new Edit);
        EXPECT_EQ(read->readFile(Qx::widen(m_folder.path(m_name)), eOpenExisting), Edit::kReadFailed)
            << "byte " << at;
        if (at >= 8) { // the signature makes it a store
            ASSERT_TRUE(salvage(bytes)) << "byte " << at << reason;
            EXPECT_GE(edit->getNumChans(), m_channels - 3) << "byte " << at << "\n" << lostText();
            EXPECT_FALSE(lost.empty()) << "byte " << at;
        }
    }
}

TEST_F(DamagedFile, NamesThatAreNoFilesAreRefused) {
    namespace fs = std::filesystem;
    fs::create_symlink(m_name.c_str(), m_folder.path("link.qme").c_str());
    fs::create_directory(m_folder.path("folder.qme").c_str());
    ASSERT_EQ(::mkfifo(m_folder.path("pipe.qme").c_str(), 0600), 0);
    for (const char* const name : {"link.qme", "folder.qme", "pipe.qme", "missing.qme"}) {
        std::vector<String> faults;
        verifyEditFile(m_folder.path(name), faults);
        EXPECT_EQ(faults.size(), 1U) << name;
        EXPECT_FALSE(salvageEdit(m_folder.path(name), edit, lost).isOk()) << name;
    }
    EXPECT_FALSE(edit.valid());
    EXPECT_FALSE(salvage("TITLE: a list\n"));
    EXPECT_FALSE(salvage(""));
}
