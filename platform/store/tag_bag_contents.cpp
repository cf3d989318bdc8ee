#include "platform/store/detail/tag_bag_contents.h"

#include "platform/store/detail/checksum.h"
#include "platform/store/detail/header_values.h"
#include "platform/store/detail/layer_revision.h"

#include <algorithm>

using namespace Qx::detail;

namespace {

/// The image goes once less than this part of what lay in it is in use; the rest is copied out of it.
constexpr size_t kLeastPartInUse = 8;

/// True if a layer that the object's class knows is of a revision from the future there.
bool hasNewerLayer(const Streamable& object, std::span<const std::byte> bytes) {
    PStream stream(bytes);
    std::vector<Streamable::PackedLayer> layers;
    const auto below = object.subLayers();
    const auto isNewer = [&](const Streamable::PackedLayer& layer) {
        return std::any_of(below.begin(), below.end(), [&](const Streamable::Form* form) {
            return layer.shortName == form->shortName && layer.major > form->major;
        });
    };
    return Streamable::readLayers(stream, layers) && std::any_of(layers.begin(), layers.end(), isNewer);
}

} // namespace

void TagBag::Contents::clear() {
    m_index.clear();
    ++life->departures;
    m_order.clear();
    entries.clear();
    image.drop();
    source = {};
    m_imageBytesInUse = 0;
    openStatus = {};
    objectStatus = {};
    numPacked = 0;
    numKept = 0;
}

TagBag::Contents::Entry* TagBag::Contents::find(std::string_view name) {
    const auto found = m_index.find(name);
    return found == m_index.end() ? nullptr : &*found->second;
}

const TagBag::Contents::Entry* TagBag::Contents::find(std::string_view name) const {
    const auto found = m_index.find(name);
    return found == m_index.end() ? nullptr : &*found->second;
}

TagBag::Contents::Entry& TagBag::Contents::findOrAdd(std::string_view name) {
    if (Entry* there = find(name)) {
        return *there;
    }
    // Beside the list until it is in the index too: memory may run out on the way.
    Entries added;
    added.emplace_back().name = String(name);
    m_index.emplace(added.front().name, added.begin());
    entries.splice(entries.end(), added);
    return entries.back();
}

void TagBag::Contents::erase(std::string_view name) {
    const auto found = m_index.find(name);
    if (found != m_index.end()) {
        const Entries::iterator entry = found->second;
        if (entry->isInImage()) {
            m_imageBytesInUse -= entry->memory.size();
        }
        takeOwned(*entry);
        m_order.clear();
        m_index.erase(found);
        entries.erase(entry);
    }
}

std::unique_ptr<Streamable> TagBag::Contents::takeOwned(Entry& entry) {
    life->departures += entry.owned != nullptr ? 1 : 0;
    if (entry.tagged != nullptr) {
        entry.changed = entry.isChanged();
        entry.tagged = nullptr;
    }
    return std::move(entry.owned);
}

void TagBag::Contents::Entry::own(std::unique_ptr<Streamable> object, bool isNew) {
    owned = std::move(object);
    tagged = dynamic_cast<Taggable*>(owned.get());
    if (tagged != nullptr) {
        tagged->setTagId(IdStamp(name));
        tagged->setTagChanged(isNew);
    }
}

TagBag::Contents::Entry* TagBag::Contents::at(size_t index) {
    if (m_order.size() != entries.size()) {
        m_order.clear();
        m_order.reserve(entries.size());
        for (Entry& entry : entries) {
            m_order.push_back(&entry);
        }
    }
    return index < m_order.size() ? m_order[index] : nullptr;
}

bool TagBag::Contents::rename(std::string_view name, std::string_view newName) {
    const auto found = m_index.find(name);
    if (found == m_index.end() || find(newName) != nullptr) {
        return false;
    }
    String taken(newName);
    auto node = m_index.extract(found);
    Entry& entry = *node.mapped();
    std::swap(entry.name, taken);
    node.key() = entry.name;
    m_index.insert(std::move(node));
    if (entry.tagged != nullptr) {
        // Tags find an object by its stamp.
        ++life->departures;
        entry.tagged->setTagId(IdStamp(entry.name));
    }
    return true;
}

void TagBag::Contents::takeImage(std::span<const StoredObject> objects, std::span<const String> complaints,
                                 bool onFile) {
    m_index.reserve(objects.size());
    for (size_t i = 0; i < objects.size(); ++i) {
        if (!complaints.empty() && !complaints[i].empty()) {
            continue;
        }
        const StoredObject& object = objects[i];
        Entry& entry = findOrAdd(object.name);
        entry.layer = String(object.layer);
        entry.major = object.major;
        entry.minor = object.minor;
        entry.place = {object.offset, object.length, object.checksum};
        entry.memory = image.bytes().subspan(object.offset, object.length);
        entry.inMemory = true;
        entry.onFile = onFile;
        entry.keeper = image.keep(entry.memory);
        m_imageBytesInUse += entry.isInImage() ? entry.memory.size() : 0;
    }
    m_imageBytes = m_imageBytesInUse;
    if (m_imageBytesInUse == 0) {
        image.drop();
    }
}

bool TagBag::Contents::bytesOf(const Entry& entry, std::vector<std::byte>& reread,
                               std::span<const std::byte>& bytes) {
    const auto who = [&] { return "object " + quoted(entry.name) + " of " + path(); };
    if (!entry.hasBytes()) {
        objectStatus = Qx::Status::failure(Qx::StatusCode::NotFound, who() + " was never written");
        return false;
    }
    bytes = entry.memory;
    if (!entry.inMemory) {
        StoreSource file;
        const bool opened = file.open(source);
        reread.resize(opened ? entry.place.length : 0);
        if (!opened || !file.read(entry.place.offset, reread) || checksum(reread) != entry.place.checksum) {
            objectStatus =
                Qx::Status::failure(Qx::StatusCode::Damaged,
                                    who() + " cannot be read again: the file was replaced, moved or damaged");
            return false;
        }
        bytes = reread;
    }
    return true;
}

bool TagBag::Contents::unpack(const Entry& entry, Streamable& object) {
    std::span<const std::byte> bytes;
    std::vector<std::byte> reread;
    if (!bytesOf(entry, reread, bytes)) {
        return false;
    }
    PStream stream(bytes, entry.inMemory ? entry.keeper : nullptr);
    if (object.STRM_hierarchyUnpack(stream) && stream.remaining() == 0) {
        return true;
    }
    const bool isSameClass = entry.layer == object.layerName();
    objectStatus = isSameClass ? checkRevision(entry, currentRevision(object).major) : Qx::Status();
    if (objectStatus && isSameClass && hasNewerLayer(object, bytes)) {
        objectStatus = Qx::Status::failure(
            Qx::StatusCode::Newer, "object " + quoted(entry.name) + " of " + path() +
                                       " was written by a newer version of this program, in a form that this "
                                       "version does not read");
    } else if (objectStatus) {
        objectStatus =
            Qx::Status::failure(Qx::StatusCode::Damaged,
                                "object " + quoted(entry.name) + " of " + path() +
                                    " does not hold what an object of class " + quoted(object.layerName()) +
                                    " is made of; it was written by another program or another class");
    }
    return false;
}

Qx::Status TagBag::Contents::checkRevision(const Entry& entry, uint8_t current) const {
    return entry.major <= current
               ? Qx::Status()
               : Qx::Status::failure(Qx::StatusCode::Newer,
                                     "object " + quoted(entry.name) + " of " + path() +
                                         " was written by a newer version of this program: it has revision " +
                                         std::to_string(entry.major) + ", this version reads " +
                                         std::to_string(current));
}

std::unique_ptr<Streamable> TagBag::Contents::build(const Entry& entry) {
    std::unique_ptr<Streamable> object = Streamable::build(entry.layer);
    if (object != nullptr && unpack(entry, *object)) {
        return object;
    }
    if (object == nullptr) {
        objectStatus = Qx::Status::failure(Qx::StatusCode::Unsupported,
                                           "object " + quoted(entry.name) + " of " + path() +
                                               " is of class " + quoted(entry.layer) +
                                               ", which this program does not know; it is kept as it is");
    } else if (objectStatus.code() != Qx::StatusCode::Newer) {
        return nullptr;
    }
    const Qx::Status why = objectStatus;
    std::span<const std::byte> bytes;
    std::vector<std::byte> reread;
    if (bytesOf(entry, reread, bytes)) {
        object = Streamable::buildFallback(entry.layer, bytes);
        if (object != nullptr && unpack(entry, *object)) {
            objectStatus = {};
            return object;
        }
    }
    objectStatus = why;
    return nullptr;
}

void TagBag::Contents::dropMemory(Entry& entry) {
    if (!entry.inMemory || !entry.onFile) {
        return;
    }
    forgetBytes(entry);
    entry.onFile = true;
    thinImage();
}

void TagBag::Contents::forgetBytes(Entry& entry) {
    if (entry.isInImage()) {
        m_imageBytesInUse -= entry.memory.size();
    }
    entry.inMemory = false;
    entry.onFile = false;
    entry.memory = {};
    entry.copied = {};
    entry.keeper.reset();
}

void TagBag::Contents::thinImage() {
    if (image.bytes().empty() || m_imageBytesInUse > m_imageBytes / kLeastPartInUse) {
        return;
    }
    for (Entry& other : entries) {
        if (other.isInImage()) {
            other.copied.assign(other.memory.begin(), other.memory.end());
            other.memory = other.copied;
        }
    }
    image.drop();
    m_imageBytesInUse = 0;
}

String TagBag::Contents::path() const {
    return id.isStorable() ? Qx::joinPath(folder, id.asString() + extension) : String();
}

/// An object that went into a file that is not yet in place.
struct TagBag::Contents::Written {
    Entry* entry;
    StoredPlace place;
    LayerRevision revision;
    String layer; ///< of one that was packed
    bool packed;
};

Qx::Status TagBag::Contents::writeEntry(StoreWriter& writer, Entry& entry, Written& written,
                                        StoreSource* from, bool& intact) {
    const Streamable* live = entry.live();
    const bool reachable = entry.inMemory || (entry.onFile && from != nullptr);
    if (live != nullptr && (entry.mustBePacked() || !reachable)) {
        written.revision = currentRevision(*live);
        written.layer = live->layerName();
        written.packed = true;
        return writer.add({entry.name, live->layerName(), written.revision.major, written.revision.minor},
                          *live, written.place);
    }
    written.revision = {entry.major, entry.minor};
    written.packed = false;
    if (entry.inMemory) {
        return writer.add(entry.label(), entry.memory, entry.place.checksum, written.place);
    }
    if (!reachable) {
        return Qx::Status::failure("object " + quoted(entry.name) + " of " + path() +
                                   " cannot be taken over: " + source.path +
                                   " was replaced, moved or damaged since it was read; nothing was written");
    }
    return writer.add(entry.label(), *from, entry.place, written.place, intact);
}

Qx::Status TagBag::Contents::write(bool keepFromSource, bool& retry) {
    retry = false;
    StoreSource file;
    StoreSource* from = nullptr;
    for (const Entry& entry : entries) {
        if (keepFromSource && from == nullptr && entry.onFile && !entry.inMemory && !entry.mustBePacked()) {
            keepFromSource = file.open(source);
            from = keepFromSource ? &file : nullptr;
        }
    }
    StoreWriter writer(path());
    if (Qx::Status status = writer.begin(); !status) {
        return status;
    }
    std::vector<Written> written;
    written.reserve(entries.size());
    for (Entry& entry : entries) {
        Written& row = written.emplace_back(Written{&entry, {}, {}, {}, false});
        bool intact = true;
        if (Qx::Status status = writeEntry(writer, entry, row, from, intact); !status) {
            return status;
        }
        if (!intact) {
            retry = true;
            return {};
        }
    }
    StoreIdentity identity;
    bool replaced = false;
    Qx::Status status = writer.commit(identity, replaced);
    if (replaced) {
        adopt(written, identity, status.isOk());
    }
    return status;
}

/// What is known of the objects becomes what the file in place holds. It asks for no memory: the file is
/// there.
void TagBag::Contents::adopt(std::vector<Written>& written, StoreIdentity& identity, bool durable) {
    std::swap(source, identity);
    numPacked = 0;
    numKept = 0;
    for (Written& row : written) {
        Entry& entry = *row.entry;
        ++(row.packed ? numPacked : numKept);
        if (row.packed) {
            std::swap(entry.layer, row.layer);
            entry.major = row.revision.major;
            entry.minor = row.revision.minor;
            forgetBytes(entry);
        }
        entry.place = row.place;
        entry.onFile = source.known;
        entry.changed = entry.changed && !durable;
        if (entry.tagged != nullptr && entry.lent == nullptr && durable) {
            entry.tagged->setTagChanged(false);
        }
    }
    try {
        thinImage();
    } catch (const std::bad_alloc&) {
        return; // the image stays as it is
    }
}
