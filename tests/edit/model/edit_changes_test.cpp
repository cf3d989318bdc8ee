#include "edit/model/edit.h"
#include "edit/project/permissions_manager.h"
#include "platform/notify/val_server.h"
#include "platform/services/network.h"
#include "tests/support/edit_builder.h"
#include "tests/support/edit_state.h"
#include "tests/support/recording_log.h"
#include "tests/support/recording_registry.h"

#include <functional>
#include <gtest/gtest.h>

using test::EditBuilder;
using test::RecordingLog;
using test::RecordingRegistry;

namespace {

const cookie kItem("E0016001");

/// Hears every message and description of an edit, in order.
class Listener {
public:
    explicit Listener(Edit& edit)
        : m_messages(edit.addListener(NotifyMsgType(),
                                      [this](const NotifyMsg& message) {
                                          heard.push_back(message.type().name() + " " + message.text());
                                      })),
          m_changes(edit.getChangeDescriptionServer().addListener(
              [this](const EditModification& change) { heard.push_back(change.name()); })) {}

    std::vector<String> heard;

private:
    Qx::Ptr<Qx::Guard> m_messages;
    Qx::Ptr<Qx::Guard> m_changes;
};

/// Carries messages nowhere and remembers them, in network mode while it lives.
class RecordingNetwork : public Qx::Network::Service {
public:
    static std::shared_ptr<RecordingNetwork> install() {
        auto service = std::make_shared<RecordingNetwork>();
        Qx::Network::setService(service);
        Qx::Network::setNetworkMode(true);
        return service;
    }
    static void remove() {
        Qx::Network::setNetworkMode(false);
        Qx::Network::setService(nullptr);
    }
    void send(const Qx::Network::Message& message) override { sent.push_back(message); }
    std::shared_ptr<void> listen(Qx::Network::Listener /*listener*/) override { return {}; }

    std::vector<Qx::Network::Message> sent;
};

using Calls = std::vector<String>;

TEST(Dirt, OtherMachinesHearWhoChangesWhat) {
    const std::shared_ptr<RecordingNetwork> network = RecordingNetwork::install();
    const EditPtr edit = EditBuilder().item(kItem).build();
    edit->set_dirty(true);
    EXPECT_EQ(network->sent.size(), 0U) << "not of an edit of log type 2";
    edit->Opts().setInt("ORIGINAL_MATERIAL", 1);
    edit->set_dirty(false);
    edit->setNetworkNotificationSuppressed(true);
    edit->set_dirty(true);
    EXPECT_EQ(network->sent.size(), 0U);
    edit->set_dirty(false);
    edit->setNetworkNotificationSuppressed(false);
    edit->set_dirty(true);
    edit->set_dirty(true);
    RecordingNetwork::remove();
    edit->set_dirty(false);
    edit->set_dirty(true);
    ASSERT_EQ(network->sent.size(), 1U);
    EXPECT_EQ(network->sent[0].kind, 5);
    EXPECT_EQ(network->sent[0].item, kItem);
    EXPECT_EQ(network->sent[0].user, PermissionsManager::getCurrentUser());
}

TEST(ReadOnly, AnEditStaysCleanAndSaysSo) {
    RecordingRegistry registry;
    const EditPtr edit = EditBuilder().item(kItem).video(1).build();
    edit->set_read_only(true);
    EXPECT_TRUE(edit->needsToBeWritten()) << "the property itself is saved";
    edit->setTemporary(true);
    EXPECT_FALSE(edit->needsToBeWritten());
    EXPECT_TRUE(edit->get_dirty()) << "a temporary edit stays as it is";
    edit->setTemporary(false);
    EXPECT_EQ(registry.take().back(), "dirty E0016001");
    edit->set_dirty(false);
    const RecordingLog log;
    const uint64_t count = edit->getModificationCount();
    edit->set_dirty(true);
    edit->setChangeDescription(kOpInsert, true);
    EXPECT_FALSE(edit->get_dirty());
    EXPECT_EQ(edit->getModificationCount(), count);
    EXPECT_EQ(edit->getChangeDescription().type(), kNotDescribed);
    EXPECT_EQ(log.log(), "Mild warning: attempt to dirty read-only edit \"E0016001\"\n");
    edit->set_read_only(false);
    EXPECT_TRUE(edit->get_dirty());
}

TEST(ReadOnly, ForTheUserIsNeverWritten) {
    const EditPtr edit = EditBuilder().item(kItem).build();
    edit->init_dirty();
    ASSERT_TRUE(edit->needsToBeWritten());
    ASSERT_TRUE(PermissionsManager::setReadOnly(kItem, true));
    edit->setChangeDescription(kOpInsert, false);
    EXPECT_EQ(edit->getModificationCount(), 0U);
    EXPECT_FALSE(edit->needsToBeWritten());
    EXPECT_FALSE(edit->get_dirty()) << "asking makes it clean";
    ASSERT_TRUE(PermissionsManager::setReadOnly(kItem, false));
}

TEST(Description, RecordsCountsAndMerges) {
    struct Case {
        std::vector<EditModificationType> changes;
        EditModificationType described; ///< in the header
        uint64_t count;
        bool dirty;
        Calls registry;
    };
    const String record = "record E0016001";
    const String dirty = "dirty E0016001";
    for (const Case& c :
         {Case{{kOpInsert}, kOpInsert, 1, true, {record, dirty}},
          Case{{kOpInsert, kOpInsert}, kOpInsert, 2, true, {record, dirty, record}},
          Case{{kCuesChanged, kLevelsChanged}, kSeveral, 2, true, {dirty}},
          Case{{kCuesChanged, kLevelsChanged, kLevelsChanged}, kSeveral, 3, true, {dirty}},
          Case{{kEditDeleted}, kEditDeleted, 1, false, {}}, Case{{kTransient}, kNotDescribed, 0, false, {}},
          Case{{kTransient, kCuesChanged}, kSeveral, 1, true, {dirty}},
          Case{{kPropertiesChanged}, kPropertiesChanged, 1, true, {record, dirty}},
          Case{{kNameChanged}, kNameChanged, 1, true, {record, dirty}},
          Case{{kChansRemoved}, kChansRemoved, 1, true, {record, dirty}},
          Case{{kOpReplaceMaterial}, kOpReplaceMaterial, 1, true, {record, dirty}}}) {
        for (const bool notify : {false, true}) {
            SCOPED_TRACE(EditModification(c.changes.back()).asString());
            RecordingRegistry registry;
            const EditPtr edit = EditBuilder().item(kItem).build();
            Listener listener(*edit);
            Calls told;
            for (const EditModificationType type : c.changes) {
                edit->setChangeDescription(type, notify);
                told.emplace_back(EditModification(type).name());
            }
            EXPECT_EQ(edit->getChangeDescription().type(), c.described);
            EXPECT_EQ(edit->getModificationCount(), c.count);
            EXPECT_EQ(edit->get_dirty(), c.dirty);
            EXPECT_EQ(registry.take(), c.registry);
            EXPECT_EQ(listener.heard, notify ? told : Calls{});
        }
    }
}

TEST(Description, SurvivesInTheHeaderWholeAndCanBeReset) {
    const EditPtr edit = EditBuilder().build();
    const EditModification change =
        EditModification(kOpRemove).setSpan(1.0 / 3, 2).setChan(IdStamp::fresh(IdStampMagic::Channel));
    edit->setChangeDescription(change, false);
    EXPECT_EQ(edit->getChangeDescription(), change);
    EXPECT_EQ(edit->getChangeDescriptionServer().getValue(), change);
    edit->set_dirty(false);
    edit->resetChangeDescription();
    EXPECT_FALSE(edit->get_dirty());
    EXPECT_EQ(edit->getChangeDescription().type(), kNotDescribed);
    edit->setChangeDescription(kCuesChanged, false);
    EXPECT_EQ(edit->getChangeDescription().type(), kCuesChanged) << "not several";
    edit->Opts().setString("CHANGE_DESCRIPTION", "1 replace done at=1 rm -rf");
    EXPECT_EQ(edit->getChangeDescription().type(), kNotDescribed);
}

TEST(Notification, OfChannelsNamesThemInOrder) {
    RecordingRegistry registry;
    const EditPtr edit = EditBuilder().item(kItem).video(1).audio(1).levels(1).build();
    (void)registry.take();
    Listener listener(*edit);
    ASSERT_TRUE(edit->insertChans(AudioChan, Edit_Chan_SubType::NONE, 1, 2, true, true, 0));
    EXPECT_EQ(listener.heard, (Calls{"editChanAdded E0016001 2 1 2", "channels-inserted"}));
    const EditModification inserted = edit->getChangeDescription();
    EXPECT_EQ(inserted.type(), kChansInserted);
    EXPECT_EQ(inserted.chan(), edit->getId(1));
    EXPECT_EQ(edit->getModificationCount(), 2U);
    EXPECT_EQ(registry.take().front(), "record E0016001");

    listener.heard.clear();
    edit->addChan(VideoChan, nullptr, true, Edit_Chan_SubType::ALIAS);
    EXPECT_EQ(listener.heard.front(), "editChanAdded E0016001 1 32768 1");

    listener.heard.clear();
    ASSERT_EQ(edit->getChanType(4), AudioChan);
    ASSERT_TRUE(edit->removeChan(edit->getId(4), true));
    EXPECT_EQ(listener.heard, (Calls{"editChanDeleted E0016001 128 5 1", "editChanDeleted E0016001 2 4 1",
                                     "channels-removed"}));
    listener.heard.clear();
    ASSERT_TRUE(edit->removeChans(true));
    EXPECT_EQ(listener.heard, (Calls{"editChanDeleted E0016001 127 0 4", "channels-removed"}));
}

TEST(Notification, OfWhatIsSetOfAChannelAndOfTheTimes) {
    const auto setAudio = [](Edit& edit, void (*change)(AudCel&)) {
        AudCel audio = edit.getAudCel(edit.getId(1));
        change(audio);
        EXPECT_TRUE(edit.setAudCel(audio));
    };
    struct Case {
        const char* told;
        bool isSound;
        bool isEdit; ///< counted and described
        std::function<void(Edit&)> change;
    };
    for (const Case& c :
         {Case{"levels", true, true,
               [&](Edit& e) { setAudio(e, [](AudCel& a) { a.setSoundOutputEnabled(false); }); }},
          Case{"levels", true, true,
               [](Edit& e) { EXPECT_TRUE(e.addLevelsChan(e.getId(1), AudLevelsCel::create()).valid()); }},
          Case{"fades", true, true,
               [&](Edit& e) { setAudio(e, [](AudCel& a) { a.setXFadesEnabled(true); }); }},
          Case{"events", true, true, [](Edit& e) { EXPECT_TRUE(e.set_edit_cel_p(1, new cel)); }},
          Case{"events", false, true, [](Edit& e) { EXPECT_TRUE(e.set_edit_cel_p(0, new cel)); }},
          Case{"sync", false, true, [](Edit& e) { EXPECT_TRUE(e.setSyncLoss(e.getId(0), 2)); }},
          Case{"current-time", false, false, [](Edit& e) { e.set_current_time(0, 2); }},
          Case{"mark", false, false, [](Edit& e) { e.set_mark_time(0, 2); }}}) {
        for (const bool shot : {false, true}) {
            SCOPED_TRACE(String(c.told) + (shot ? " of a shot" : ""));
            const EditPtr edit = EditBuilder().item(kItem).video(1).audio(1).build();
            edit->Opts().setInt("ORIGINAL_MATERIAL", shot ? 1 : 0);
            edit->setChangeDescription(kOpInsert, false);
            edit->set_dirty(false);
            Listener listener(*edit);
            c.change(*edit);
            Calls told{shot && c.isSound ? "shot-sound" : c.told};
            if (shot && c.isSound) {
                told.push_back("editShotSound E0016001 " + edit->getId(1).asString());
            }
            EXPECT_EQ(listener.heard, told);
            EXPECT_TRUE(edit->get_dirty());
            EXPECT_EQ(edit->getModificationCount(), c.isEdit ? 2U : 1U);
            EXPECT_EQ(edit->getChangeDescription().type(), c.isEdit ? kSeveral : kOpInsert);
            edit->setChangeDescription(kOpInsert, false);
            EXPECT_EQ(edit->getChangeDescription().type(), c.isEdit ? kSeveral : kOpInsert);
        }
    }
}

TEST(Notification, OfTheEditItself) {
    const EditPtr edit = EditBuilder().item(kItem).video(1).build();
    Listener listener(*edit);
    edit->notifyEditDelete();
    edit->notifyImpendingRevisionChange(kRevisionUndo);
    edit->notifyRevisionChange(kRevisionRedo);
    edit->notifyShotSoundAltered(edit->getId(0));
    EXPECT_EQ(listener.heard,
              (Calls{"editDelete E0016001", "deleted", "impendingRevChange E0016001 2",
                     "revChange E0016001 3", "editShotSound E0016001 " + edit->getId(0).asString()}));
    EXPECT_FALSE(edit->get_dirty());
    EXPECT_EQ(edit->getModificationCount(), 1U);
    EXPECT_EQ(Edit::getEditChangedNotifyMsgType(), NotifyMsgType("editChanged"));
}

TEST(Listeners, MayDropTheLastHandleWhileTold) {
    struct Case {
        const char* what;
        void (*change)(Edit& edit);
    };
    for (const Case& c : {Case{"describe", [](Edit& edit) { edit.setChangeDescription(kOpLift, true); }},
                          Case{"add", [](Edit& edit) { edit.addChan(AudioChan); }},
                          Case{"remove", [](Edit& edit) { edit.removeChan(edit.getId(0), true); }},
                          Case{"remove all", [](Edit& edit) { edit.removeChans(true); }},
                          Case{"name", [](Edit& edit) { edit.setName("x"); }},
                          Case{"channel name", [](Edit& edit) { edit.setChanName(edit.getId(0), "x"); }},
                          Case{"delete", [](Edit& edit) { edit.notifyEditDelete(); }}}) {
        SCOPED_TRACE(c.what);
        EditPtr edit = EditBuilder().item(kItem).video(1).build();
        int told = 0;
        const auto drop = [&] {
            ++told;
            edit.invalidate();
        };
        const auto message = edit->addListener(NotifyMsgType(), [&](const NotifyMsg&) { drop(); });
        const auto change =
            edit->getChangeDescriptionServer().addListener([&](const EditModification&) { drop(); });
        Edit& raw = *edit;
        c.change(raw);
        EXPECT_GE(told, 1);
        EXPECT_FALSE(edit.valid());
    }
}

TEST(Listeners, MayEditSubscribeAndUnsubscribeWhileTold) {
    const EditPtr edit = EditBuilder().item(kItem).video(1).build();
    Qx::Ptr<Qx::Guard> own;
    Qx::Ptr<Qx::Guard> late;
    int added = 0;
    int heardLate = 0;
    own = edit->addListener(Edit::getChanAddedNotifyMsgType(), [&](const NotifyMsg&) {
        ++added;
        own.reset();
        late = edit->addListener(Edit::getChanAddedNotifyMsgType(), [&](const NotifyMsg&) { ++heardLate; });
        EXPECT_TRUE(edit->removeChan(edit->getId(0), true));
        EXPECT_TRUE(edit->insertChans(AudioChan, Edit_Chan_SubType::NONE, NO_CHAN, 1, false, true, 0));
    });
    EXPECT_TRUE(edit->insertChans(VideoChan, Edit_Chan_SubType::NONE, NO_CHAN, 1, false, true, 0));
    EXPECT_EQ(added, 1);
    EXPECT_EQ(heardLate, 1) << "of the insertion that the first listener made";
    EXPECT_EQ(edit->getNumChans(), 2);
    EXPECT_EQ(edit->getChanType(0), VideoChan);
    EXPECT_EQ(edit->getChangeDescription().type(), kSeveral);
}

} // namespace
