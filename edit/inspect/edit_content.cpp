#include "edit/inspect/edit_content.h"

#include "edit/model/aud_levels_cel.h"
#include "edit/model/channel_group_list.h"
#include "edit/model/managed_cel.h"
#include "platform/services/files.h"
#include "platform/store/edit_header_proxy.h"
#include "platform/store/object_store_info.h"

#include <algorithm>

namespace {

configb propertiesOf(const Edit& edit, int index) {
    configb properties;
    const IdStamp id = edit.getId(index);
    if (const String name = edit.getChanName(id); !name.empty()) {
        properties.setString("name", name);
    }
    if (const String material = edit.getMaterialInfo(id); !material.empty()) {
        properties.setString("material", material);
    }
    if (const cel* content = edit.get_edit_cel_p(index); content != nullptr && content->resolution() != 0) {
        properties.setDouble("resolution_s", content->resolution());
    }
    if (const double loss = edit.getSyncLoss(id); loss != 0) {
        properties.setDouble("sync_loss_s", loss);
    }
    if (edit.getChanType(index) == AudioChan) {
        const AudCel audio = edit.getAudCel(id);
        if (!audio.getSoundOutputEnabled()) {
            properties.setBool("output", false);
        }
        if (audio.getXFadesEnabled()) {
            properties.setBool("cross_fades", true);
        }
    }
    return properties;
}

String placeOf(const EditReport& report, const IdStamp& id) {
    for (const ChannelReport& channel : report.channels) {
        if (channel.id == id) {
            return channel.place;
        }
    }
    return id.asString();
}

std::vector<GroupContent> groupsOf(const ChannelGroupList* list, const EditReport& report) {
    std::vector<GroupContent> groups;
    for (unsigned i = 0; list != nullptr && i < list->size(); ++i) {
        GroupContent& group = groups.emplace_back();
        group.type = list->getGroup(i)->getType();
        for (const IdStamp& id : list->getGroup(i)->getChans()) {
            group.channels.push_back(placeOf(report, id));
        }
    }
    return groups;
}

/// Whether an object of a file is one that an edit is made of (docs/edit-file.md).
bool isPartOfEdit(const String& name, const EditReport& report) {
    constexpr std::string_view kCel = "Celid";
    if (name.starts_with(kCel)) {
        return name.size() > kCel.size() && name.find_first_not_of("0123456789", kCel.size()) == String::npos;
    }
    return name == EditHeaderProxy::EditHeaderId || name == "CueId" || name == ChannelGroupList::Id ||
           name == ChannelGroupList::IdForDefaultGrouping ||
           std::any_of(report.channels.begin(), report.channels.end(), [&](const ChannelReport& channel) {
               return channel.isLevels() && channel.id.asString() == name;
           });
}

} // namespace

EditContent contentOf(const Edit& edit, const EditReport& report) {
    EditContent content;
    content.header = edit.Opts();
    for (size_t i = 0; i < report.channels.size(); ++i) {
        const ChannelReport& channel = report.channels[i];
        content.channels.push_back({channel.place, propertiesOf(edit, static_cast<int>(i))});
        if (channel.isLevels()) {
            content.levels.push_back({channel.place, edit.getLevelsCel(channel.id).getNodeStore().nodes()});
        }
    }
    content.groups = groupsOf(edit.retrieveGroupsList(), report);
    content.defaultGroups = groupsOf(edit.retrieveDefaultGroupsList(), report);
    return content;
}

Qx::Status addObjects(EditContent& content, const EditReport& report, const String& path) {
    std::vector<StoredObjectInfo> stored;
    String damage;
    if (Qx::Status status = examineStore(path, stored, damage); !status) {
        return status;
    }
    std::erase_if(stored, [&](const StoredObjectInfo& object) { return isPartOfEdit(object.name, report); });
    String bytes;
    if (!stored.empty()) {
        if (const Qx::FileError error = Qx::readWholeFile(path, bytes, UINT64_MAX)) {
            return Qx::Status::failure(error.text());
        }
    }
    for (const StoredObjectInfo& object : stored) {
        // Somebody may have replaced the file since it was examined.
        if (!object.sound || object.offset > bytes.size() || object.length > bytes.size() - object.offset) {
            return Qx::Status::failure(
                "object " + object.name + " of " + path +
                " cannot be read: " + (object.sound ? String("the file changed; try again") : object.reason));
        }
        content.objects.push_back({object.name,
                                   object.layer,
                                   {object.revisionMajor, object.revisionMinor},
                                   bytes.substr(object.offset, object.length)});
    }
    return {};
}
