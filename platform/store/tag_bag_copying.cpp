#include "platform/store/detail/header_values.h"
#include "platform/store/detail/tag_bag_contents.h"

#include <set>

using namespace Qx::detail;

Qx::Status TagBag::copyObject(TagBag& from, std::string_view name, std::string_view newName) {
    if (!isStoredName(newName)) {
        return Qx::Status::failure(Qx::StatusCode::BadArgument,
                                   quoted(newName) + " cannot be the name of an object");
    }
    if (&from == this && name == newName && contains(name)) {
        return {};
    }
    if (const Streamable* const object = from.openObject(name)) {
        storeObject(newName, object->clone());
        return {};
    }
    const Qx::Status why = from.objectStatus();
    const Contents::Entry* const entry = from.m_contents->find(name);
    if (entry == nullptr || entry->lent != nullptr) {
        return why;
    }
    std::vector<std::byte> reread;
    std::span<const std::byte> bytes;
    if (!from.m_contents->bytesOf(*entry, reread, bytes)) {
        return from.objectStatus();
    }
    from.m_contents->objectStatus = {};
    Contents::Entry& made = m_contents->findOrAdd(newName);
    m_contents->forgetBytes(made);
    made.lent = nullptr;
    m_contents->takeOwned(made);
    made.changed = false;
    made.layer = entry->layer;
    made.major = entry->major;
    made.minor = entry->minor;
    made.copied.assign(bytes.begin(), bytes.end());
    made.memory = made.copied;
    made.place = {0, bytes.size(), entry->place.checksum};
    made.inMemory = true;
    return {};
}

Qx::Status TagBag::copyAndStoreComponents(TagBag& from, std::span<const IdStamp> objects, StampMap& renamed) {
    // Everything that is copied, and what each copy shall be called.
    std::vector<IdStamp> found;
    StampMap made = renamed;
    std::set<IdStamp> seen;
    Vector<IdStamp> open(objects.rbegin(), objects.rend());
    Vector<IdStamp> references;
    while (!open.empty()) {
        const IdStamp id = open.back();
        open.pop_back();
        if (!seen.insert(id).second) {
            continue;
        }
        found.push_back(id);
        references.clear();
        if (const auto* const tagged = dynamic_cast<const Taggable*>(from.openObject(id))) {
            tagged->listReferences(references);
        } else if (!from.contains(id)) {
            return Qx::Status::failure(Qx::StatusCode::NotFound, "there is no object " + id.asString());
        }
        std::erase_if(references, [&](const IdStamp& reference) { return !from.contains(reference); });
        open.insert(open.end(), references.rbegin(), references.rend());
        if (const auto [place, fresh] = made.emplace(id, IdStamp()); fresh || !place->second.valid()) {
            place->second = IdStamp::fresh(id.getMagicType());
        }
    }
    // The copies, all of them before the first is bound.
    TagBag copies;
    for (const IdStamp& id : found) {
        if (Qx::Status status = copies.copyObject(from, id.asText(), made[id].asText()); !status) {
            return status;
        }
    }
    for (const IdStamp& id : found) {
        const IdStamp name = made[id];
        if (auto* const tagged = dynamic_cast<Taggable*>(copies.openObject(name))) {
            tagged->renameReferences(made);
        }
        if (std::unique_ptr<Streamable> object = copies.extractObject(name)) {
            storeObject(name, std::move(object));
        } else if (Qx::Status status = copyObject(copies, name.asText(), name.asText()); !status) {
            return status;
        }
    }
    renamed = std::move(made);
    return {};
}
