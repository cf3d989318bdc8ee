#include "platform/store/tag.h"

#include "platform/store/detail/tag_bag_contents.h"

#include <utility>

TagTypeId::TagTypeId(std::string_view id) : m_id(id.empty() ? nullptr : std::make_shared<const String>(id)) {}

const String& TagTypeId::id() const {
    static const String& none = *new String;
    return m_id != nullptr ? *m_id : none;
}

Taggable::~Taggable() = default;

void Taggable::listReferences(Vector<IdStamp>&) const {}

void Taggable::renameReferences(const StampMap&) {}

Taggable& Taggable::operator=(const Taggable& other) {
    m_tagChanged = m_tagChanged || this != &other;
    return *this;
}

TagBase::TagBase(TagBag& bag, const IdStamp& id) {
    if (id.valid()) {
        m_life = bag.m_life;
        m_id = id;
    }
}

Streamable* TagBase::find() const {
    m_object = nullptr;
    if (TagBag* const its = bag()) {
        TagBag::Contents::Entry* const entry = its->m_contents->find(m_id.asText());
        const bool isLive = entry != nullptr && entry->lent == nullptr && entry->owned != nullptr;
        m_object = isLive ? entry->owned.get() : entry != nullptr ? its->openObject(m_id) : nullptr;
        m_foundAt = m_life->departures;
    }
    return m_object;
}

bool TagBase::destroy() {
    TagBag* const its = bag();
    return its != nullptr && its->removeObject(m_id);
}
