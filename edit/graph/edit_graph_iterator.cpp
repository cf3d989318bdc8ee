#include "edit/graph/edit_graph_iterator.h"

#include "edit/model/edit.h"

#include <algorithm>
#include <cmath>

namespace {

/// How deep a stack is at first.
constexpr size_t kUsualDepth = 10;

} // namespace

EditGraphIterator::EditGraphIterator(int flags) {
    setFlags(flags);
}

EditGraphIterator::EditGraphIterator(const EditPtr& edit, const IdStamp& trackId, const double& time,
                                     int flags)
    : m_time(time), m_rootEdit(edit), m_extents(time, time) {
    setFlags(flags);
    init(trackId);
}

EditGraphIterator::EditGraphIterator(const EditPtr& edit, int chanIndex, const double& time, int flags)
    : EditGraphIterator(edit, edit.valid() ? edit->getId(chanIndex) : IdStamp(), time, flags) {}

EditGraphIterator::EditGraphIterator(const CelEventPair& pair, double time, int flags)
    : m_time(time), m_rootTrackId(pair.trackId()), m_rootEdit(pair.getEdit()), m_extents(time, time),
      m_valid(m_rootEdit.valid()) {
    setFlags(flags);
    initFromPair(pair, true);
}

EditGraphIterator::EditGraphIterator(EditPtr edit, double time, Tag<FXGraphNodeBase> node,
                                     const Extents& extents, int flags)
    : m_time(time), m_rootTrackId(node.id()), m_rootEdit(std::move(edit)), m_extents(extents),
      m_valid(m_rootEdit.valid()) {
    setFlags(flags);
    if (m_valid && node.valid()) {
        EntryPtr entry = freshEntry();
        static_cast<Tag<FXGraphNodeBase>&>(*entry) = node;
        entry->edit = m_rootEdit;
        entry->editRange = entry->editRange1 = extents;
        addStackItem(std::move(entry));
    }
}

EditGraphIterator::EditGraphIterator(const EditGraphIterator& other)
    : EditGraphIterator(other, other.getIterationFlags()) {}

EditGraphIterator::EditGraphIterator(const EditGraphIterator& other, int flags) {
    copyFrom(other, flags);
}

EditGraphIterator::EditGraphIterator(const String& state)
    : EditGraphIterator(EditGraphIteratorState(state)) {}

EditGraphIterator::EditGraphIterator(const EditGraphIteratorState& state) : m_time(state.time) {
    setFlags(state.flags);
    restore(state);
}

EditGraphIterator& EditGraphIterator::operator=(const EditGraphIterator& other) {
    if (this != &other) {
        clear();
        copyFrom(other, other.getIterationFlags());
    }
    return *this;
}

EditGraphIterator::~EditGraphIterator() = default;

bool EditGraphIterator::operator==(const EditGraphIterator& other) const {
    if (m_valid != other.m_valid || getIterationFlags() != other.getIterationFlags() ||
        m_current != other.m_current || m_rootEdit != other.m_rootEdit ||
        m_rootTrackId != other.m_rootTrackId || m_above != other.m_above ||
        !(m_time == other.m_time || (std::isnan(m_time) && std::isnan(other.m_time)))) {
        return false;
    }
    return std::equal(m_stack.begin(), m_stack.begin() + m_current + 1, other.m_stack.begin(),
                      [](const EntryPtr& a, const EntryPtr& b) { return *a == *b; });
}

void EditGraphIterator::setFlags(int flags) {
    m_bidirectional = (flags & kBidirectional) != 0;
    m_traverseGhosts = (flags & kTraverseGhosts) != 0;
    m_materialShortfallDetection = (flags & kMaterialShortfallDetection) != 0;
}

int EditGraphIterator::getIterationFlags() const {
    return (m_bidirectional ? kBidirectional : 0) | (m_traverseGhosts ? kTraverseGhosts : 0) |
           (m_materialShortfallDetection ? kMaterialShortfallDetection : 0);
}

void EditGraphIterator::init(const IdStamp& track) {
    clear();
    m_rootTrackId = track;
    m_valid = m_rootEdit.valid();
    initFromPair(CelEventPair(m_rootEdit, track, m_time), false);
}

void EditGraphIterator::initFromPair(CelEventPair pair, bool keepsMaterial) {
    if (!m_valid || !pair.valid()) {
        invalidate();
        return;
    }
    m_extents = pair.editRange(CelEventPair::CutToCut);
    EntryPtr entry = freshEntry();
    fill(*entry, std::move(pair), m_time);
    const bool isKept = entry->ceh.valid() != 0 && (keepsMaterial || entry->valid() ||
                                                    m_rootEdit->getChanType(m_rootTrackId) == AudioChan);
    if (isKept) {
        addStackItem(std::move(entry));
    } else {
        recycle(std::move(entry));
    }
}

void EditGraphIterator::copyFrom(const EditGraphIterator& other, int flags) {
    setFlags(flags);
    m_stack.clear();
    m_time = other.m_time;
    m_rootTrackId = other.m_rootTrackId;
    m_rootEdit = other.m_rootEdit;
    m_extents = other.m_extents;
    m_valid = other.m_valid;
    m_held = other.m_held;
    m_above = other.m_above;
    if (other.m_current < 0) {
        return;
    }
    const int first = m_bidirectional ? 0 : other.m_current;
    for (int level = 0; level < first; ++level) {
        const Transforms& passed = other.entryAt(level)->transforms;
        m_above.insert(m_above.end(), passed.begin(), passed.end());
    }
    m_stack.reserve(std::max(kUsualDepth, static_cast<size_t>(other.m_current - first) + 1));
    for (int level = first; level <= other.m_current; ++level) {
        m_stack.push_back(std::make_unique<ItorStackEntry>(*other.entryAt(level)));
    }
    m_current = other.m_current - first;
    m_numTransforms = other.m_numTransforms;
}

void EditGraphIterator::countTransforms() {
    m_numTransforms = m_above.size();
    for (int level = 0; level <= m_current; ++level) {
        m_numTransforms += m_stack[static_cast<size_t>(level)]->transforms.size();
    }
}

void EditGraphIterator::clear() {
    for (; m_current >= 0; --m_current) {
        recycle(std::move(m_stack[static_cast<size_t>(m_current)]));
    }
    m_above.clear();
    m_held.clear();
    m_numTransforms = 0;
}

void EditGraphIterator::invalidate() {
    clear();
    m_valid = false;
}

ItorStackEntry* EditGraphIterator::entryAt(int level) const {
    const int at = level == -1 ? m_current : level;
    return m_valid && at >= 0 && at <= m_current ? m_stack[static_cast<size_t>(at)].get() : nullptr;
}

const ItorStackEntry* EditGraphIterator::getEntry(int level) const {
    return entryAt(level);
}

EffectInstance* EditGraphIterator::currentEffect() const {
    const ItorStackEntry* const entry = entryAt(-1);
    return entry != nullptr ? entry->getFXPtr() : nullptr;
}

EditGraphIterator::EntryPtr EditGraphIterator::freshEntry() {
    if (m_spares.empty()) {
        return std::make_unique<ItorStackEntry>();
    }
    EntryPtr entry = std::move(m_spares.back());
    m_spares.pop_back();
    return entry;
}

void EditGraphIterator::recycle(EntryPtr entry) {
    entry->invalidate();
    m_spares.push_back(std::move(entry));
}

void EditGraphIterator::addStackItem(EntryPtr entry) {
    if (m_bidirectional || m_current < 0) {
        m_stack.reserve(kUsualDepth);
        ++m_current;
        if (static_cast<size_t>(m_current) >= m_stack.size()) {
            m_stack.emplace_back();
        }
    } else {
        EntryPtr left = std::move(m_stack[static_cast<size_t>(m_current)]);
        m_above.insert(m_above.end(), left->transforms.begin(), left->transforms.end());
        recycle(std::move(left));
    }
    m_numTransforms += entry->transforms.size();
    m_stack[static_cast<size_t>(m_current)] = std::move(entry);
}

bool EditGraphIterator::moveBack() {
    if (!m_valid || !m_bidirectional || m_current < 1) {
        return false;
    }
    EntryPtr left = std::move(m_stack[static_cast<size_t>(m_current)]);
    m_numTransforms -= left->transforms.size();
    recycle(std::move(left));
    --m_current;
    return true;
}

bool EditGraphIterator::moveBackAll() {
    if (!m_valid || !m_bidirectional || m_current < 0) {
        return false;
    }
    while (moveBack()) {
    }
    return true;
}

bool EditGraphIterator::moveBackToCompoundEffect() {
    const ItorStackEntry* const here = entryAt(-1);
    if (here == nullptr || !here->valid()) {
        return false;
    }
    for (int level = m_current - 1; m_bidirectional && level >= 0; --level) {
        const ItorStackEntry& above = *entryAt(level);
        const FXGraphNodeBase* const node = above.get();
        const bool isHead =
            node != nullptr && above.bag() == here->bag() &&
            std::ranges::find(node->getCompoundMembers(), here->id()) != node->getCompoundMembers().end();
        if (isHead) {
            while (m_current > level) {
                static_cast<void>(moveBack());
            }
            return true;
        }
    }
    return (*here)->isCompoundEffectHead();
}

Tag<FXGraphNodeBase> EditGraphIterator::getNodeH(int level) const {
    const ItorStackEntry* const entry = entryAt(level);
    return entry != nullptr && entry->valid() ? static_cast<const Tag<FXGraphNodeBase>&>(*entry)
                                              : Tag<FXGraphNodeBase>();
}

IdStamp EditGraphIterator::getNodeId(int level) const {
    const ItorStackEntry* const entry = entryAt(level);
    return entry != nullptr && entry->valid() ? entry->id() : IdStamp();
}

IdStamp EditGraphIterator::getChanId(int level) const {
    const ItorStackEntry* const entry = entryAt(level);
    return entry != nullptr && entry->edit.valid() && entry->chanIndex != NO_CHAN
               ? entry->edit->getId(entry->chanIndex)
               : IdStamp();
}

int EditGraphIterator::getChanIndex(int level) const {
    const ItorStackEntry* const entry = entryAt(level);
    return entry != nullptr ? entry->chanIndex : static_cast<int>(NO_CHAN);
}

ce_handle EditGraphIterator::getUTRHandle(int level) const {
    const ItorStackEntry* const entry = entryAt(level);
    return entry != nullptr ? entry->ceh : ce_handle();
}

double EditGraphIterator::getStartEditTime(int level, RangeType type) const {
    return entryAt(level) != nullptr ? getRange(level, type).start() : Qx::kNoPairTime;
}

double EditGraphIterator::getEndEditTime(int level, RangeType type) const {
    return entryAt(level) != nullptr ? getRange(level, type).end() : Qx::kNoPairTime;
}

EditGraphIterator::Extents EditGraphIterator::getRange(int level, RangeType type) const {
    const ItorStackEntry* const entry = entryAt(level);
    if (entry == nullptr) {
        return Editable::invalidRange();
    }
    return type == RangeType::WithFades ? entry->editRange1 : entry->editRange;
}

EditPtr EditGraphIterator::getEditH() const {
    return m_valid ? m_rootEdit : EditPtr();
}

EditPtr EditGraphIterator::getCurrentPosEdit() const {
    const ItorStackEntry* const entry = entryAt(-1);
    return entry != nullptr ? entry->edit : getEditH();
}

int EditGraphIterator::getParentInputNum() const {
    const ItorStackEntry* const entry = entryAt(-1);
    return entry != nullptr ? entry->parentInputNum : -1;
}

double EditGraphIterator::getEditEndTime() const {
    return m_valid ? m_rootEdit->getEndTime() : Qx::kNoPairTime;
}

double EditGraphIterator::mapToLevel(double time, int level) const {
    if (m_numTransforms == 0) {
        return time;
    }
    for (const EditByRefTimeTransform& transform : m_above) {
        time = transform.applyTo(time);
    }
    for (int i = 0; i <= level; ++i) {
        for (const EditByRefTimeTransform& transform : entryAt(i)->transforms) {
            time = transform.applyTo(time);
        }
    }
    return time;
}

double EditGraphIterator::applyTimeTransformsStackTo(double time, bool inverse) const {
    if (!m_valid || m_current < 0 || m_numTransforms == 0) {
        return time;
    }
    if (!inverse) {
        return mapToLevel(time, m_current);
    }
    const auto undo = [&](const Transforms& transforms) {
        for (auto its = transforms.rbegin(); its != transforms.rend(); ++its) {
            time = its->inverseApplyTo(time);
        }
    };
    for (int level = m_current; level >= 0; --level) {
        undo(entryAt(level)->transforms);
    }
    undo(m_above);
    return time;
}

double EditGraphIterator::opacityAt(int level, double time) const {
    const ItorStackEntry& entry = *entryAt(level);
    const EffectInstance* const effect = entry.getFXPtr();
    return effect != nullptr ? effect->getAlphaAt(mapToLevel(time, level) - entry.eventStart()) : 1;
}

double EditGraphIterator::getAlphaAt(double time) const {
    double alpha = 1;
    for (int level = 0; m_valid && level <= m_current; ++level) {
        alpha *= opacityAt(level, time);
    }
    return alpha;
}

double EditGraphIterator::getCompoundAlpha() const {
    const ItorStackEntry* const here = entryAt(-1);
    if (here == nullptr || !here->valid()) {
        return 1;
    }
    EditGraphIterator head(*this);
    static_cast<void>(head.moveBackToCompoundEffect());
    const ItorStackEntry& its = *head.entryAt(-1);
    double alpha = head.opacityAt(head.m_current, m_time);
    for (const IdStamp& member : its->getCompoundMembers()) {
        const Tag<EffectInstance> effect(*its.bag(), member);
        if (effect.valid()) {
            alpha *= effect->getAlphaAt(head.mapToLevel(m_time, head.m_current) - its.eventStart());
        }
    }
    return alpha;
}

bool EditGraphIterator::isCompoundEffectHead() const {
    const FXGraphNodeBase* const node = getNodeH(-1).get();
    return node != nullptr && node->isCompoundEffectHead();
}

void EditGraphIterator::updateExtents(double a, double b) {
    if (std::isnan(a) || std::isnan(b)) {
        return;
    }
    if (m_extents.start() == m_extents.end()) {
        m_extents = Extents(a, b);
    }
    double low = m_extents.start();
    double high = m_extents.end();
    const auto isInside = [&](double t) {
        return t >= low - Qx::kTimeTolerance && t <= high + Qx::kTimeTolerance;
    };
    if (isInside(a)) {
        low = a;
    }
    if (isInside(b)) {
        high = b;
    }
    m_extents = Extents(low, high);
}
