#include "platform/store/tag_bag.h"

#include "platform/base/ole_splat.h"
#include "platform/store/detail/header_values.h"
#include "platform/store/detail/layer_revision.h"
#include "platform/store/detail/salvage.h"
#include "platform/store/detail/tag_bag_contents.h"
#include "platform/store/tag.h"

#include <cerrno>
#include <list>
#include <map>
#include <set>

using namespace Qx::detail;

namespace {

String refusal(const String& path, Qx::FileKind kind) {
    switch (kind) {
    case Qx::FileKind::Folder:
        return path + " is a folder, not an object store; move it away";
    case Qx::FileKind::Link:
        return path + " is a symbolic link, which is not followed; put the file itself in its place";
    default:
        return path + " is not a regular file; move it away";
    }
}

Qx::Status readFailure(const Qx::FileError& error, const String& path) {
    if (error.code == EFBIG) {
        return error.status().retold(path +
                                     " is larger than 4 GiB, the greatest size of an object store; check "
                                     "that this is the file you mean");
    }
    return error.status();
}

Qx::Status doesNotExist(const String& path) {
    return Qx::Status::failure(Qx::StatusCode::NotFound, path + " does not exist");
}

TagBag::OpenResult resultOf(StoreState state) {
    switch (state) {
    case StoreState::Sound:
        return TagBag::Opened;
    case StoreState::Foreign:
        return TagBag::Foreign;
    case StoreState::Newer:
        return TagBag::Newer;
    case StoreState::Damaged:
        break;
    }
    return TagBag::Damaged;
}

Qx::Status noObject(std::string_view name) {
    return Qx::Status::failure(Qx::StatusCode::NotFound, "there is no object " + quoted(name));
}

/// What a name stands for, as far as it decides the result of opening; Opened for a regular file.
TagBag::OpenResult lookAt(const String& path, Qx::Status& complaint) {
    const Qx::FileAnswer found = Qx::askFile(path);
    if (found.isMissing()) {
        complaint = doesNotExist(path);
        return TagBag::Missing;
    }
    if (!found.isRegular()) {
        const Qx::Status obstacle = found.obstacle().status();
        complaint = found.isUnknown() ? obstacle : obstacle.retold(refusal(path, found.kind()));
        return TagBag::NotOpened;
    }
    return TagBag::Opened;
}

} // namespace

TagBag::TagBag() : m_life(std::make_shared<TagBagLife>()), m_contents(std::make_unique<Contents>()) {
    m_life->bag = this;
    m_contents->life = m_life;
}

TagBag::~TagBag() {
    m_life->bag = nullptr;
}

TagBag::OpenResult TagBag::open(const cookie& item, const String& inFolder, eEditOpenBehaviour behaviour,
                                const String& extension) {
    close();
    m_contents->id = item;
    m_contents->folder = inFolder;
    m_contents->extension = extension;
    OpenResult result = NewStore;
    if (extension.find('/') != String::npos || extension.find('\0') != String::npos) {
        m_contents->openStatus =
            Qx::Status::failure(Qx::StatusCode::BadArgument, quoted(extension) + " cannot end a file name");
        result = NotOpened;
    } else if (behaviour != eOpenNew) {
        result = openFile(behaviour);
    }
    m_contents->isOpen = result == Opened || result == NewStore;
    m_contents->lastResult = result;
    return result;
}

TagBag::OpenResult TagBag::openFile(eEditOpenBehaviour behaviour) {
    Contents& bag = *m_contents;
    const String name = bag.path();
    if (name.empty()) {
        bag.openStatus = Qx::Status::failure(Qx::StatusCode::BadArgument,
                                             "the item " + quoted(bag.id.asString()) +
                                                 " has no file: its identity cannot form a name");
        return NotOpened;
    }
    const OpenResult seen = lookAt(name, bag.openStatus);
    if (seen == Missing && behaviour == eOpenOrCreate) {
        bag.openStatus = {};
        return NewStore;
    }
    if (seen != Opened) {
        return seen;
    }
    StoreVerdict verdict;
    if (const Qx::FileError error = bag.image.read(name, true, verdict)) {
        bag.image.drop();
        if (error.code == ENOENT) {
            // It went since it was looked at.
            bag.openStatus = doesNotExist(name);
            return Missing;
        }
        bag.openStatus = readFailure(error, name);
        return NotOpened;
    }
    std::vector<StoredObject> objects;
    if (verdict.isSound()) {
        verdict = judgeStore(bag.image.bytes(), objects);
    }
    if (!verdict.isSound()) {
        bag.image.drop();
        bag.openStatus = verdict.status(name);
        return resultOf(verdict.state);
    }
    bag.source = bag.image.identity();
    bag.takeImage(objects, {}, true);
    return Opened;
}

TagBag::OpenResult TagBag::openSalvaging(const String& file, std::vector<StoredObjectInfo>& lost) {
    close();
    lost.clear();
    Contents& bag = *m_contents;
    const OpenResult seen = lookAt(file, bag.openStatus);
    if (seen != Opened) {
        return seen;
    }
    std::vector<StoredObject> objects;
    std::vector<String> complaints;
    StoreVerdict verdict;
    if (const Qx::Status status = salvageStore(file, bag.image, objects, complaints, verdict); !status) {
        bag.image.drop();
        bag.openStatus = status;
        return verdict.isSound() ? (bag.image.identity().known ? Damaged : NotOpened)
                                 : resultOf(verdict.state);
    }
    for (size_t i = 0; i < objects.size(); ++i) {
        if (!complaints[i].empty()) {
            lost.push_back(infoOf(objects[i], complaints[i]));
        }
    }
    bag.takeImage(objects, complaints, false);
    bag.folder = Qx::folderOf(file);
    bag.extension = Qx::extensionOf(Qx::fileNameOf(file));
    bag.isOpen = true;
    return Opened;
}

TagBag::OpenResult TagBag::openScanning(const String& file, const ScanNamer& nameOf,
                                        std::vector<StoredObjectInfo>& unchecked) {
    close();
    unchecked.clear();
    Contents& bag = *m_contents;
    const OpenResult seen = lookAt(file, bag.openStatus);
    if (seen != Opened) {
        return seen;
    }
    StoreVerdict verdict;
    if (const Qx::FileError error = bag.image.read(file, false, verdict)) {
        bag.image.drop();
        bag.openStatus = readFailure(error, file);
        return NotOpened;
    }
    std::vector<StoredObject> objects;
    std::list<ScanLabel> labels;
    if (verdict.state != StoreState::Foreign && verdict.state != StoreState::Newer) {
        std::map<std::string_view, size_t> before;
        for (ScannedObject& found : scanStore(bag.image.bytes())) {
            const size_t number = before[found.form]++;
            if (found.object.name.empty()) {
                const ScanLabel& label = labels.emplace_back(nameOf(found.form, number));
                found.object.name = label.name;
                found.object.layer = label.layer;
                if (!isStoredName(label.name) || !isStoredName(label.layer)) {
                    continue;
                }
                unchecked.push_back(infoOf(found.object, "no checksum vouches for it"));
                unchecked.back().layer = String(found.form);
            }
            objects.push_back(found.object);
        }
    }
    if (objects.empty()) {
        bag.image.drop();
        if (verdict.isSound()) {
            verdict = StoreVerdict::damaged("no object can be found in it");
        }
        bag.openStatus = verdict.status(file);
        return resultOf(verdict.state);
    }
    std::set<std::string_view> taken;
    std::erase_if(objects, [&](const StoredObject& object) { return !taken.insert(object.name).second; });
    bag.takeImage(objects, {}, false);
    bag.folder = Qx::folderOf(file);
    bag.extension = Qx::extensionOf(Qx::fileNameOf(file));
    bag.isOpen = true;
    return Opened;
}

const String& TagBag::openError() const {
    return m_contents->openStatus.reason();
}

const Qx::Status& TagBag::openStatus() const {
    return m_contents->openStatus;
}

TagBag::OpenResult TagBag::lastOpenResult() const {
    return m_contents->lastResult;
}

bool TagBag::isOpen() const {
    return m_contents->isOpen;
}

void TagBag::close() {
    m_contents->clear();
    m_contents->id = invalid_cookie;
    m_contents->folder.clear();
    m_contents->extension.clear();
    m_contents->isOpen = false;
}

const cookie& TagBag::id() const {
    return m_contents->id;
}

void TagBag::setId(const cookie& item) {
    m_contents->id = item;
}

const String& TagBag::folder() const {
    return m_contents->folder;
}

void TagBag::setFolder(const String& inFolder) {
    m_contents->folder = inFolder;
}

void TagBag::setExtension(const String& extension) {
    m_contents->extension = extension;
}

Qx::FileInfo TagBag::fileInfo() const {
    Qx::FileInfo unknown;
    unknown.kind = Qx::FileKind::Unknown;
    return m_contents->source.infoKnown && m_contents->source.path == path() ? m_contents->source.info
                                                                             : unknown;
}

String TagBag::path() const {
    return m_contents->path();
}

void TagBag::storeObject(std::string_view name, std::unique_ptr<Streamable> object) {
    if (object == nullptr || !isStoredName(name) || !isStoredName(object->layerName())) {
        ole_splat("TagBag::storeObject( %s ) - no object, or a name that cannot be stored",
                  quoted(name).c_str());
        return;
    }
    Contents::Entry& entry = m_contents->findOrAdd(name);
    m_contents->forgetBytes(entry);
    entry.lent = nullptr;
    m_contents->takeOwned(entry);
    entry.own(std::move(object), true);
    entry.changed = true;
}

void TagBag::lendObject(std::string_view name, const Streamable& object, bool changed) {
    if (!isStoredName(name) || !isStoredName(object.layerName())) {
        ole_splat("TagBag::lendObject( %s ) - a name that cannot be stored", quoted(name).c_str());
        return;
    }
    Contents::Entry& entry = m_contents->findOrAdd(name);
    m_contents->takeOwned(entry);
    entry.lent = &object;
    entry.changed = entry.changed || changed || entry.layer != object.layerName();
}

void TagBag::releaseLent() noexcept {
    for (auto place = m_contents->entries.begin(); place != m_contents->entries.end();) {
        Contents::Entry& entry = *place++;
        const bool isOnlyLent = entry.lent != nullptr && !entry.hasBytes();
        entry.lent = nullptr;
        if (isOnlyLent) {
            m_contents->erase(entry.name);
        }
    }
}

Streamable* TagBag::openObject(std::string_view name) {
    m_contents->objectStatus = {};
    Contents::Entry* entry = m_contents->find(name);
    if (entry == nullptr || entry->lent != nullptr) {
        m_contents->objectStatus =
            entry == nullptr
                ? noObject(name)
                : Qx::Status::failure(Qx::StatusCode::Locked, "object " + quoted(name) + " is lent");
        return nullptr;
    }
    if (entry->owned == nullptr) {
        entry->own(m_contents->build(*entry), false);
        if (entry->owned != nullptr) {
            m_contents->dropMemory(*entry);
        }
    }
    return entry->owned.get();
}

uint64_t TagBag::numDepartures() const {
    return m_life->departures;
}

std::unique_ptr<Streamable> TagBag::extractObject(std::string_view name) {
    Contents::Entry* entry = m_contents->find(name);
    if (entry != nullptr && entry->lent != nullptr) {
        m_contents->objectStatus = Qx::Status::failure(
            Qx::StatusCode::Locked, "object " + quoted(name) + " was lent; it is its lender's again");
        entry->lent = nullptr;
        if (!entry->hasBytes()) {
            m_contents->erase(name);
        }
        return nullptr;
    }
    if (openObject(name) == nullptr) {
        return nullptr;
    }
    std::unique_ptr<Streamable> object = m_contents->takeOwned(*entry);
    if (auto* const tagged = dynamic_cast<Taggable*>(object.get())) {
        tagged->setTagId({});
    }
    if (!entry->hasBytes()) {
        m_contents->erase(name);
    }
    return object;
}

bool TagBag::readObject(std::string_view name, Streamable& object) {
    m_contents->objectStatus = {};
    Contents::Entry* entry = m_contents->find(name);
    if (entry == nullptr) {
        m_contents->objectStatus = noObject(name);
        return false;
    }
    if (!m_contents->unpack(*entry, object)) {
        return false;
    }
    m_contents->dropMemory(*entry);
    return true;
}

const String& TagBag::objectError() const {
    return m_contents->objectStatus.reason();
}

const Qx::Status& TagBag::objectStatus() const {
    return m_contents->objectStatus;
}

void TagBag::markChanged(std::string_view name) {
    Contents::Entry* entry = m_contents->find(name);
    if (entry != nullptr && entry->live() != nullptr) {
        entry->changed = true;
    }
}

bool TagBag::removeObject(std::string_view name) {
    const bool there = m_contents->find(name) != nullptr;
    m_contents->erase(name);
    return there;
}

Qx::Status TagBag::checkRevisions() const {
    std::map<std::string_view, int> known; // the major revision of a class; that of no object if it is not
    for (const Contents::Entry& entry : m_contents->entries) {
        const auto [place, isNew] = known.try_emplace(entry.layer, UINT8_MAX);
        if (isNew) {
            if (const std::unique_ptr<Streamable> object = Streamable::build(entry.layer)) {
                place->second = currentRevision(*object).major;
            }
        }
        if (Qx::Status status = m_contents->checkRevision(entry, static_cast<uint8_t>(place->second));
            !status) {
            return status;
        }
    }
    return {};
}

bool TagBag::renameObject(std::string_view name, std::string_view newName) {
    return isStoredName(newName) && m_contents->rename(name, newName);
}

bool TagBag::contains(std::string_view name) const {
    return m_contents->find(name) != nullptr;
}

size_t TagBag::getNumObjects() const {
    return m_contents->entries.size();
}

TagBase TagBag::operator[](size_t index) {
    const Contents::Entry* const entry = m_contents->at(index);
    return entry != nullptr ? TagBase(*this, IdStamp(entry->name)) : TagBase();
}

std::vector<String> TagBag::names() const {
    std::vector<String> list;
    list.reserve(m_contents->entries.size());
    for (const Contents::Entry& entry : m_contents->entries) {
        list.push_back(entry.name);
    }
    return list;
}

Qx::Status TagBag::flush() {
    if (!m_contents->isOpen) {
        return Qx::Status::failure(Qx::StatusCode::BadArgument,
                                   "the object store is not open; open it before it is written");
    }
    if (m_contents->path().empty()) {
        return Qx::Status::failure(Qx::StatusCode::BadArgument,
                                   "the item " + quoted(m_contents->id.asString()) +
                                       " cannot be written: its identity cannot form a file name");
    }
    bool retry = false;
    Qx::Status status = m_contents->write(true, retry);
    return retry ? m_contents->write(false, retry) : status;
}

size_t TagBag::numPacked() const {
    return m_contents->numPacked;
}

size_t TagBag::numKept() const {
    return m_contents->numKept;
}
