#pragma once

#include "platform/base/export.h"
#include "platform/base/id_stamp.h"
#include "platform/base/vector.h"

#include <map>
#include <memory>

class TagBag;

/// Stamps and what becomes of each when what bears or names them is copied.
using StampMap = std::map<IdStamp, IdStamp>;

/// The type identifier of a tagged object: a text that tells its kind apart from all others, more finely than
/// its class does. It lives in files. A small value: copies share the text. Thread-safe like a `String`.
class QM_API TagTypeId {
public:
    /// The identifier of an object of no kind: an empty text.
    TagTypeId() = default;
    explicit TagTypeId(std::string_view id);

    [[nodiscard]] const String& id() const;
    [[nodiscard]] bool valid() const { return m_id != nullptr; }
    bool operator==(const TagTypeId& other) const { return id() == other.id(); }

private:
    std::shared_ptr<const String> m_id;
};

/// What makes a `Streamable` a tagged object: it has a type identifier, knows the stamp under which a `TagBag`
/// holds it, names the objects and channels that it refers to, and tells whether it was changed. Bags find
/// this side of an object by themselves. Used by one thread at a time, like the bag.
class QM_API Taggable {
public:
    virtual ~Taggable();

    [[nodiscard]] virtual const TagTypeId& tagTypeId() const = 0;

    /// The stamp under which a bag holds the object; null for one that no bag holds, or holds under a name.
    /// It is not packed: a bag sets it when the object is bound or opened.
    [[nodiscard]] const IdStamp& tagId() const { return m_tagId; }
    void setTagId(const IdStamp& id) { m_tagId = id; }

    /// Appends every stamp that the object names, of objects beside it in its bag, of channels or of anything
    /// else. Null stamps are left out.
    virtual void listReferences(Vector<IdStamp>& stamps) const;
    /// Stamps that the object names become those that `renamed` gives for them; others stay.
    virtual void renameReferences(const StampMap& renamed);

    /// True from a change of the object until the bag that holds it has written it. A bag packs a changed
    /// object without being told.
    [[nodiscard]] bool isTagChanged() const { return m_tagChanged; }
    void setTagChanged(bool changed) { m_tagChanged = changed; }

protected:
    Taggable() = default;
    /// A copy is held by no bag and counts as changed.
    Taggable(const Taggable&) {}
    /// The object keeps its stamp and counts as changed.
    Taggable& operator=(const Taggable& other);

private:
    IdStamp m_tagId;
    bool m_tagChanged = true;
};
