#include "platform/effects/orphaned_component_list.h"

#include <algorithm>
#include <cmath>

namespace {

/// The form of the stamps, as it is written before each.
constexpr uint8_t kStampRevision = 2;
constexpr size_t kPackedEntry = 1 + 12 + 8 + 8;

const bool kOrphansRegistered = [] {
    Streamable::registerBuilder(OrphanedComponentList::kForm.name, []() -> std::unique_ptr<Streamable> {
        return std::make_unique<OrphanedComponentList>();
    });
    return true;
}();

} // namespace

// In files: do not change it.
constinit const StreamableLayer::Form OrphanedComponentList::kForm{Id, "O"};

OrphanedComponentList::~OrphanedComponentList() = default;

const OrphanedComponentList::Entry* OrphanedComponentList::find(const IdStamp& node) const {
    const auto found = std::find_if(m_entries.begin(), m_entries.end(),
                                    [&](const Entry& entry) { return entry.node == node; });
    return found != m_entries.end() ? &*found : nullptr;
}

void OrphanedComponentList::add(const Tag<FXGraphNodeBase>& node, const Range& range) {
    if (node.id().valid() && find(node.id()) == nullptr) {
        m_entries.push_back({node.id(), range});
        setTagChanged(true);
    }
}

bool OrphanedComponentList::isOrphan(const Tag<FXGraphNodeBase>& node) const {
    return find(node.id()) != nullptr;
}

OrphanedComponentList::Range OrphanedComponentList::getRangeFor(const Tag<FXGraphNodeBase>& node) const {
    const Entry* const entry = find(node.id());
    return entry != nullptr ? entry->range : Range();
}

bool OrphanedComponentList::remove(const Tag<FXGraphNodeBase>& node) {
    const Entry* const entry = find(node.id());
    if (entry == nullptr) {
        return false;
    }
    m_entries.erase(m_entries.begin() + (entry - m_entries.data()));
    setTagChanged(true);
    return true;
}

void OrphanedComponentList::findIntersecting(double t, Vector<IdStamp>& nodes) const {
    for (const Entry& entry : m_entries) {
        if (entry.range.start() - Qx::kTimeTolerance <= t && entry.range.end() - t > Qx::kTimeTolerance) {
            nodes.push_back(entry.node);
        }
    }
}

IdStamp OrphanedComponentList::operator[](size_t index) const {
    return index < m_entries.size() ? m_entries[index].node : IdStamp();
}

const TagTypeId& OrphanedComponentList::tagTypeId() const {
    static const TagTypeId id(kForm.name);
    return id;
}

void OrphanedComponentList::pack(PStream& stream) const {
    stream.setUnsignedLong(size());
    for (const Entry& entry : m_entries) {
        stream.setCookedChar(kStampRevision);
        entry.node.pack(stream);
        stream.setDouble(entry.range.start());
        stream.setDouble(entry.range.end());
    }
}

void OrphanedComponentList::unpack(PStream& stream) {
    if (isFromTheFuture()) {
        stream.fail();
        return;
    }
    std::vector<Entry> entries(stream.getCount(kPackedEntry));
    for (Entry& entry : entries) {
        entry.node.unpack(stream, stream.getCookedChar());
        const double low = stream.getDouble();
        const double high = stream.getDouble();
        entry.range = Range(low, high);
        if (!std::isfinite(low) || !std::isfinite(high) || !entry.node.valid()) {
            stream.fail();
        }
    }
    if (stream.good()) {
        m_entries = std::move(entries);
        setCurrentRevision();
    }
}

std::unique_ptr<Streamable> OrphanedComponentList::clone(BuilderType) const {
    return std::make_unique<OrphanedComponentList>(*this);
}
