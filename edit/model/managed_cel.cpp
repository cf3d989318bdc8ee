#include "edit/model/managed_cel.h"

#include <cmath>

ManagedCel::~ManagedCel() = default;

bool ManagedCel::simplify(Simplification::Type type) {
    return noted(valid() && m_cel->simplify(type));
}

ManagedCel::Range ManagedCel::getExtents(Editable::ExtentType type, bool fromZero) const {
    return valid() ? m_cel->getExtents(type, fromZero) : Editable::invalidRange();
}

bool ManagedCel::insert(const ManagedCel& source, const Range& sourceRange, double at, cel::IdMap& ids,
                        cel::Splits* splits) {
    return noted(valid() && m_cel->insert(source.getCel(), sourceRange, at, ids, splits));
}

bool ManagedCel::remove(const Range& range, cel::Splits* splits) {
    return noted(valid() && m_cel->remove(range, splits));
}

bool ManagedCel::replace(const ManagedCel& source, const Range& sourceRange, double at, cel::IdMap& ids,
                         bool materialOnly, cel::Splits* splits) {
    return noted(valid() && m_cel->replace(source.getCel(), sourceRange, at, ids, materialOnly, splits));
}

bool ManagedCel::noted(bool changed) {
    if (changed) {
        modification();
    }
    return changed;
}

void ManagedCel::modification() {}

Qx::Ptr<cel> ManagedCel::cloneCel() const {
    return valid() ? std::make_shared<cel>(*m_cel) : nullptr;
}

VidCel VidCel::create() {
    return {std::make_shared<cel>(), IdStamp::fresh(IdStampMagic::Channel)};
}

VFXCel VFXCel::create() {
    return {std::make_shared<cel>(), IdStamp::fresh(IdStampMagic::Channel)};
}

AudCel AudCel::create() {
    return {std::make_shared<cel>(), IdStamp::fresh(IdStampMagic::Channel)};
}

AudCel AudCel::clone() const {
    AudCel made(cloneCel(), id());
    made.m_levels = m_levels;
    made.m_output = m_output;
    made.m_xfades = m_xfades;
    return made;
}

void AudCel::setXFadesEnabled(bool on) {
    m_xfades = on;
    if (!on) {
        invalidateXFadeCels();
    }
}

bool AudCel::getXFadeCelsValid() const {
    return m_xfades && valid() && m_xfadeCels[0] != nullptr && m_xfadeCels[1] != nullptr &&
           m_xfadeChangeCount == getCel()->changeCount();
}

cel* AudCel::getXFadeCel(unsigned number) const {
    return number < 2 && getXFadeCelsValid() ? m_xfadeCels[number].get() : nullptr;
}

void AudCel::invalidateXFadeCels() {
    m_xfadeCels[0] = nullptr;
    m_xfadeCels[1] = nullptr;
}

void AudCel::setXFadeCels(Qx::Ptr<cel> first, Qx::Ptr<cel> second) {
    m_xfadeCels[0] = std::move(first);
    m_xfadeCels[1] = std::move(second);
    m_xfadeChangeCount = valid() ? getCel()->changeCount() : 0;
}

bool AudCel::setFadeLength(const ce_handle& event, unsigned short quarterFrames) {
    if (!valid() || getCel()->check_ceh(event) == 0) {
        return false;
    }
    ce_handle content = event;
    content.set_audioRamp_DurationQFrames(quarterFrames);
    modification();
    return true;
}

bool AudCel::setShotSound(double time, BeginEnd end, float level) {
    if (!valid() || !std::isfinite(level)) {
        return false;
    }
    const CEHPair pair(*getCel(), time);
    if (!pair.valid()) {
        return false;
    }
    ce_handle content = end == BeginEnd::Begin ? pair.inH() : pair.outH();
    content.set_strip_level(level);
    modification();
    return true;
}

void AudCel::modification() {
    invalidateXFadeCels();
}
