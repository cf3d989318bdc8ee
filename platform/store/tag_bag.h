#pragma once

#include "platform/base/cookie.h"
#include "platform/base/id_stamp.h"
#include "platform/base/open_behaviour.h"
#include "platform/base/status.h"
#include "platform/services/files.h"
#include "platform/store/object_store_info.h"
#include "platform/store/streamable.h"
#include "platform/store/taggable.h"

#include <functional>
#include <memory>
#include <span>
#include <vector>

class TagBase;

/// What tags know of their bag; it outlives the bag while a tag holds it.
struct TagBagLife {
    TagBag* bag = nullptr;
    uint64_t departures = 0; ///< see `TagBag::numDepartures`
};

/// A store of tagged objects, one file. It owns the objects that are bound to it and knows their bytes; it
/// knows nothing of edits, undo or notification.
///
/// An object is found by its tag: a name, or an `IdStamp` (kept under its text). An object is in one of two
/// states: *held* as a live `Streamable` that the store owns or that is lent to it for a save, or *stored* as
/// bytes. Objects whose class is not known to this program stay bytes and are written again as they are; where
/// a layer of theirs is known, they can be opened as what that layer makes of them
/// (`Streamable::registerFallback`).
///
/// An object that is also a `Taggable` is told its stamp, and packed when it says that it was changed. For
/// others, `markChanged` says so.
///
/// The file's form is docs/file-format.md. Writing is atomic (`Qx::AtomicFile`). Not thread-safe: one bag is
/// used by one thread at a time.
class QM_API TagBag {
public:
    /// Outcome of `open`. The first three values are fixed.
    enum OpenResult {
        Opened = 0,    ///< the file was read and every checksum holds
        NotOpened = 1, ///< the file system refused, or the name is no regular file; see `openError`
        NewStore = 2,  ///< there was no file, or behaviour 1 was asked: the store is open and empty
        Missing = 3,   ///< there is no file and behaviour 0 was asked
        Foreign = 4,   ///< not an object store
        Newer = 5,     ///< an object store of a format version from the future
        Damaged = 6    ///< an object store that is truncated, has a wrong checksum or contradicts itself
    };

    TagBag();
    ~TagBag();
    TagBag(const TagBag&) = delete;
    TagBag& operator=(const TagBag&) = delete;

    /// Opens the store of an item: the file of the cookie's text and `extension` (with its dot) in `folder`.
    /// The whole file is checked, every checksum included, before this returns. Behaviour 0 opens what
    /// exists, 1 starts empty whatever is there, 2 opens or starts empty. On a result other than 0 and 2 the
    /// bag is closed and `openError` tells why. What it held before is dropped.
    OpenResult open(const cookie& item, const String& folder, eEditOpenBehaviour behaviour,
                    const String& extension);
    /// Opens what can be saved of a damaged store: the objects whose bytes are sound are there, the others
    /// are told of in `lost`. Possible while the table of the file is whole (`examineStore`); otherwise the
    /// bag is closed, `openError` tells why and the result is that of `open`. The bag has no id, so that a
    /// flush cannot replace the damaged file before `setId` (and `setFolder`) tell where the salvage shall
    /// go.
    OpenResult openSalvaging(const String& path, std::vector<StoredObjectInfo>& lost);
    /// What `openScanning` takes an object for that no table names.
    struct ScanLabel {
        String name;  ///< empty leaves the object out
        String layer; ///< full name of its most derived layer
    };
    /// The label for the short name of an object's most derived layer, `form`. `before` tells how many
    /// objects of that layer stand before it in the file.
    using ScanNamer = std::function<ScanLabel(std::string_view form, size_t before)>;
    /// Opens what can be found of a damaged store whose table is not whole, of one that was cut off for
    /// instance. Rows of the table that still read, and whose object's bytes have the checksum that they
    /// tell, give their objects as they are. The other objects are looked for by their form; nothing vouches
    /// for those but that, so whoever unpacks them checks what they hold. `unchecked` tells of them; their
    /// layer there is the short one. Of two objects with one name the first stays. Otherwise as
    /// `openSalvaging`; Damaged when there is no object at all.
    OpenResult openScanning(const String& path, const ScanNamer& nameOf,
                            std::vector<StoredObjectInfo>& unchecked);
    /// One sentence for a person: the path, what is wrong and what can be done. Empty after a success.
    [[nodiscard]] const String& openError() const;
    /// The same with its kind: `NotFound` for Missing, `Damaged` for Damaged and Foreign, `Newer`; what the
    /// system said, or `BadArgument`, for NotOpened.
    [[nodiscard]] const Qx::Status& openStatus() const;
    /// The result of the last `open`, also after the bag was closed; `Missing` before the first.
    [[nodiscard]] OpenResult lastOpenResult() const;
    [[nodiscard]] bool isOpen() const;
    void close();

    [[nodiscard]] const cookie& id() const;
    void setId(const cookie& item);
    [[nodiscard]] const String& folder() const;
    void setFolder(const String& folder);
    /// The extension of the file's name, with its dot.
    void setExtension(const String& extension);
    [[nodiscard]] String path() const;
    /// The file under `path` as it was when this bag read or wrote it; it may be another one since. Of kind
    /// Unknown when it did neither.
    [[nodiscard]] Qx::FileInfo fileInfo() const;

    /// Binds an object under a name; the bag owns it, and a former object of that name goes. It counts as
    /// changed.
    void storeObject(std::string_view name, std::unique_ptr<Streamable> object);
    void storeObject(const IdStamp& id, std::unique_ptr<Streamable> object) {
        storeObject(id.asText(), std::move(object));
    }
    /// Lends an object to the bag until `extractObject` or `releaseLent`; the caller keeps ownership, and an
    /// object that the bag owned under the name goes. With `changed` false, and bytes known for the name,
    /// those are kept and the object is not packed, unless they can be had no more or an earlier lending with
    /// `changed` true was not followed by a flush that succeeded. An object that was never written goes from
    /// the bag when its loan ends.
    void lendObject(std::string_view name, const Streamable& object, bool changed);
    void releaseLent() noexcept;

    /// The object under a name, as a live object that the bag owns: unpacked from its bytes on the first
    /// call. Null when there is none or its bytes do not make one; `objectError` then tells which. The
    /// pointer is good until the object goes: while `numDepartures` is what it was, none has.
    [[nodiscard]] Streamable* openObject(std::string_view name);
    /// Allocates nothing for an object that is open.
    [[nodiscard]] Streamable* openObject(const IdStamp& id) { return openObject(id.asText()); }
    /// How often live objects that the bag owned went from it: replaced, lent over, handed over, removed, or
    /// with the whole content. Never falls.
    [[nodiscard]] uint64_t numDepartures() const;
    /// The same, handed over: the bag knows the bytes still (see `lendObject`) but owns no object any more;
    /// an object that was never written goes from the bag. Bytes of an object handed over are not kept in
    /// memory but found again in the file: if that was replaced or moved since, and no object is lent in
    /// their place, a flush fails. For an object that is lent the loan ends and the result is null.
    [[nodiscard]] std::unique_ptr<Streamable> extractObject(std::string_view name);
    [[nodiscard]] std::unique_ptr<Streamable> extractObject(const IdStamp& id) {
        return extractObject(id.asText());
    }
    /// Unpacks the bytes under a name, as they were last written or read, into an object that the caller has.
    /// False when there are none or they
    /// do not fit; the object is then as its `unpack` promises.
    [[nodiscard]] bool readObject(std::string_view name, Streamable& object);
    /// Why the last call of `openObject`, `extractObject` or `readObject` yielded nothing: a sentence, empty
    /// after a success.
    [[nodiscard]] const String& objectError() const;
    /// The same with its kind: `NotFound` when there is none, `Unsupported` for one of a class that this
    /// program does not know, `Newer`, `Damaged`, `Locked` while it is lent.
    [[nodiscard]] const Qx::Status& objectStatus() const;

    /// `Newer`, telling of the first, when the bag has an object of a class that this program knows in a
    /// revision that only a later version of it reads; a success otherwise. Objects of other classes do not
    /// count.
    [[nodiscard]] Qx::Status checkRevisions() const;

    /// Declares a held object changed, so that the next flush packs it.
    void markChanged(std::string_view name);
    /// Removes an object and its bytes. False when there is none.
    bool removeObject(std::string_view name);
    bool removeObject(const IdStamp& id) { return removeObject(id.asText()); }
    /// Gives an object another name; its bytes and its place in the file stay. False, changing nothing, when
    /// there is no such object, the new name is taken, or it cannot be stored.
    bool renameObject(std::string_view name, std::string_view newName);

    [[nodiscard]] bool contains(std::string_view name) const;
    [[nodiscard]] bool contains(const IdStamp& id) const { return contains(id.asText()); }
    [[nodiscard]] size_t getNumObjects() const;
    /// The object at a place in the order of the file, from 0; its stamp is null where a name is none. Beyond
    /// the end, a tag that names nothing.
    [[nodiscard]] TagBase operator[](size_t index);
    /// The names, in the order of the file.
    [[nodiscard]] std::vector<String> names() const;

    /// Copies an object of `from`, which may be this bag, under another name: a clone of what is open, else
    /// its bytes as they are, so that one of an unknown class can be copied too. An object of that name goes.
    /// A failure, changing nothing, when there is none, its bytes cannot be had or it is lent.
    Qx::Status copyObject(TagBag& from, std::string_view name, std::string_view newName);
    /// Copies objects of `from`, which may be this bag, and every object there that they refer to, however
    /// remotely, each once. `renamed` tells and is told which stamp here stands for which there: an object
    /// whose stamp it holds gets the stamp it gives, any other a fresh one of the same magic type. What the
    /// copies refer to is renamed with it, and so are stamps of other things, channels for instance, that
    /// `renamed` holds. The order is that of `objects`, each followed by what it refers to.
    ///
    /// A failure, changing neither bag nor map, when an object of `objects` is not there or an object cannot
    /// be copied. References to what is no object of `from` are no failure.
    Qx::Status copyAndStoreComponents(TagBag& from, std::span<const IdStamp> objects, StampMap& renamed);

    /// Writes every object to the file, atomically and durably, in the order of the file, new ones at the end
    /// in the order of their binding. The same objects give the same bytes. On failure the old file is
    /// untouched and everything still counts as changed; only when the file could not be made durable after
    /// it was written whole, the name may hold the new file already. A changed object is written in the
    /// revision of this program.
    Qx::Status flush();
    /// How many objects the last `flush` packed, and how many it took over as bytes.
    [[nodiscard]] size_t numPacked() const;
    [[nodiscard]] size_t numKept() const;

private:
    friend class TagBase;
    class Contents;
    OpenResult openFile(eEditOpenBehaviour behaviour);
    std::shared_ptr<TagBagLife> m_life;
    std::unique_ptr<Contents> m_contents;
};
