#pragma once

#include "platform/store/tag_bag.h"
#include "platform/store/taggable.h"

#include <concepts>

/// Names an object by the bag that holds it and its stamp. It owns nothing and may outlive object and bag: it
/// then names nothing. The object is found when it is first asked for and remembered while no object leaves
/// the bag, so that asking again costs a comparison. Copies are independent. Used by one thread at a time,
/// like the bag.
class QM_API TagBase {
public:
    /// Names nothing.
    TagBase() = default;
    /// Names the object with that stamp, whether there is one or not; nothing for the null stamp.
    TagBase(TagBag& bag, const IdStamp& id);

    /// The stamp, also after the object has gone; null for a tag that names nothing.
    [[nodiscard]] const IdStamp& id() const { return m_id; }
    /// The bag; null when it has gone.
    [[nodiscard]] TagBag* bag() const { return m_life != nullptr ? m_life->bag : nullptr; }
    /// The object, opened if need be; null when there is none, or it cannot be opened (`TagBag::objectStatus`
    /// then tells why). Allocates nothing unless it has to be opened. The bag owns it; good until an object leaves the bag.
    [[nodiscard]] Streamable* object() const { return isFresh() ? m_object : find(); }
    /// True if the object can be opened.
    [[nodiscard]] bool valid() const { return object() != nullptr; }
    /// Removes the object and its bytes from the bag; every tag of it names nothing from then on. Objects that
    /// it refers to stay. False when there was none.
    bool destroy();
    /// Names nothing any more.
    void clear() { *this = TagBase(); }

    /// True for one stamp in one bag, or if both name nothing.
    bool operator==(const TagBase& other) const { return m_id == other.m_id && bag() == other.bag(); }

protected:
    /// Changes whenever another object may be found than before.
    [[nodiscard]] uint64_t foundAt() const { return m_foundAt; }

private:
    /// True while `m_object` is the object.
    [[nodiscard]] bool isFresh() const {
        return m_object != nullptr && m_life->bag != nullptr && m_life->departures == m_foundAt;
    }
    Streamable* find() const;

    std::shared_ptr<const TagBagLife> m_life;
    IdStamp m_id;
    mutable Streamable* m_object = nullptr;
    mutable uint64_t m_foundAt = 0;
};

/// A tag of an object of class `T`. An object of another class under the stamp is none. `T` may be incomplete
/// where the object is not asked for.
template <typename T>
class Tag : public TagBase {
public:
    Tag() = default;
    Tag(TagBag& bag, const IdStamp& id) : TagBase(bag, id) {}
    /// The object that another tag names, seen as a `T`.
    explicit Tag(const TagBase& other) : TagBase(other) {}
    template <std::derived_from<T> Derived>
    Tag(const Tag<Derived>& other) : TagBase(other) {}

    /// As `object`, and null for an object of another class.
    [[nodiscard]] T* get() const {
        Streamable* const its = object();
        if (m_typed == nullptr || m_typedAt != foundAt()) {
            m_typed = dynamic_cast<T*>(its);
            m_typedAt = foundAt();
        }
        return its != nullptr ? m_typed : nullptr;
    }
    [[nodiscard]] bool valid() const { return get() != nullptr; }
    explicit operator bool() const { return valid(); }
    /// For a valid tag.
    T* operator->() const { return get(); }
    T& operator*() const { return *get(); }

private:
    mutable T* m_typed = nullptr;
    mutable uint64_t m_typedAt = 0;
};
