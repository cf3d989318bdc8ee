#include "platform/store/object_store_info.h"

#include "platform/store/detail/object_store_file.h"
#include "platform/store/detail/salvage.h"

using namespace Qx::detail;

Qx::Status Qx::detail::salvageStore(const String& path, StoreImage& image, std::vector<StoredObject>& objects,
                                    std::vector<String>& complaints, StoreVerdict& verdict) {
    if (const FileError error = image.read(path, false, verdict)) {
        return error.status();
    }
    const StoreVerdict table = readStoreTable(image.bytes(), objects);
    // A file of another kind has no table either; what it is says more.
    if (!table.isSound() || verdict.state == StoreState::Foreign || verdict.state == StoreState::Newer) {
        objects.clear();
        return (verdict.isSound() ? table : verdict).status(path);
    }
    if (verdict.isSound()) {
        verdict = judgeStorePlaces(image.bytes(), objects);
    }
    for (const StoredObject& object : objects) {
        complaints.push_back(judgeStoredObject(image.bytes(), object));
        if (verdict.isSound() && !complaints.back().empty()) {
            verdict = StoreVerdict::damaged(complaints.back());
        }
    }
    return {};
}

StoredObjectInfo Qx::detail::infoOf(const StoredObject& object, const String& complaint) {
    StoredObjectInfo info;
    info.name = String(object.name);
    info.layer = String(object.layer);
    info.revisionMajor = object.major;
    info.revisionMinor = object.minor;
    info.offset = object.offset;
    info.length = object.length;
    info.sound = complaint.empty();
    info.reason = complaint;
    return info;
}

Qx::Status examineStore(const String& path, std::vector<StoredObjectInfo>& objects, String& damage) {
    objects.clear();
    damage.clear();
    StoreImage image;
    std::vector<StoredObject> rows;
    std::vector<String> complaints;
    StoreVerdict verdict;
    if (Qx::Status status = salvageStore(path, image, rows, complaints, verdict); !status) {
        return status;
    }
    for (size_t i = 0; i < rows.size(); ++i) {
        objects.push_back(infoOf(rows[i], complaints[i]));
    }
    damage = verdict.sentence(path);
    return {};
}
