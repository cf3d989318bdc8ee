#pragma once

#include "edit/model/cel.h"
#include "platform/base/ptr.h"

/// A counted reference to a cel together with its channel's stamp: how an edit holds its channels. Copying
/// shares the cel; `clone` of a typed form makes one of its own.
class QM_API ManagedCel {
public:
    using Range = cel::Range;

    ManagedCel() = default;
    ManagedCel(Qx::Ptr<cel> shared, const IdStamp& id) : m_cel(std::move(shared)), m_id(id) {}
    virtual ~ManagedCel();
    ManagedCel(const ManagedCel&) = default;
    ManagedCel& operator=(const ManagedCel&) = default;

    [[nodiscard]] static ManagedCel createInvalid() { return {}; }
    /// One with a deep copy of the cel and the same stamp; a typed form's own `clone` keeps what that form
    /// has besides.
    [[nodiscard]] ManagedCel clone() const { return {cloneCel(), m_id}; }

    [[nodiscard]] bool valid() const { return m_cel != nullptr; }
    [[nodiscard]] const IdStamp& id() const { return m_id; }
    void id(const IdStamp& id) { m_id = id; }
    /// Null for an invalid one.
    [[nodiscard]] cel* getCel() const { return m_cel.get(); }
    [[nodiscard]] const Qx::Ptr<cel>& sharedCel() const { return m_cel; }

    bool simplify(Simplification::Type type);
    [[nodiscard]] Range getExtents(Editable::ExtentType type = Editable::Everything,
                                   bool fromZero = false) const;
    /// \name The operations of `cel` of these names; false, with nothing changed, for an invalid one
    /// @{
    bool insert(const ManagedCel& source, const Range& sourceRange, double at, cel::IdMap& ids,
                cel::Splits* splits = nullptr);
    bool remove(const Range& range, cel::Splits* splits = nullptr);
    bool replace(const ManagedCel& source, const Range& sourceRange, double at, cel::IdMap& ids,
                 bool materialOnly = false, cel::Splits* splits = nullptr);
    /// @}

protected:
    /// Called on every change made through this object.
    virtual void modification();
    /// A deep copy of the cel; null for an invalid one.
    [[nodiscard]] Qx::Ptr<cel> cloneCel() const;

private:
    /// Passes on whether something was changed, and tells `modification` if so.
    bool noted(bool changed);

    Qx::Ptr<cel> m_cel;
    IdStamp m_id;
};

/// The cel of a video channel.
class QM_API VidCel : public ManagedCel {
public:
    using ManagedCel::ManagedCel;
    [[nodiscard]] static VidCel createInvalid() { return {}; }
    /// A new, empty one with a fresh channel stamp.
    [[nodiscard]] static VidCel create();
    [[nodiscard]] VidCel clone() const { return {cloneCel(), id()}; }
};

/// The cel of an effects channel.
class QM_API VFXCel : public ManagedCel {
public:
    using ManagedCel::ManagedCel;
    [[nodiscard]] static VFXCel createInvalid() { return {}; }
    [[nodiscard]] static VFXCel create();
    [[nodiscard]] VFXCel clone() const { return {cloneCel(), id()}; }
};

/// Which end of a span.
enum class BeginEnd { Begin, End };

/// The cel of an audio channel, with what sound needs besides.
class QM_API AudCel : public ManagedCel {
public:
    using ManagedCel::ManagedCel;
    [[nodiscard]] static AudCel createInvalid() { return {}; }
    [[nodiscard]] static AudCel create();
    [[nodiscard]] AudCel clone() const;

    [[nodiscard]] const IdStamp& getLevelsChanID() const { return m_levels; }
    void setLevelsChanID(const IdStamp& id) { m_levels = id; }
    [[nodiscard]] bool getSoundOutputEnabled() const { return m_output; }
    void setSoundOutputEnabled(bool on) { m_output = on; }

    /// \name Cross-fades
    /// Overlapping sounds lie on two helper cels while cross-fades are on. Any change of the cel makes them
    /// out of date, also one through another object that shares it.
    /// @{
    [[nodiscard]] bool getXFadesEnabled() const { return m_xfades; }
    void setXFadesEnabled(bool on);
    [[nodiscard]] bool getXFadeCelsValid() const;
    /// Number 0 or 1; null unless valid.
    [[nodiscard]] cel* getXFadeCel(unsigned number) const;
    void invalidateXFadeCels();
    void setXFadeCels(Qx::Ptr<cel> first, Qx::Ptr<cel> second);
    /// @}

    /// Sets the fade at an event. False for a handle that is not of this cel.
    bool setFadeLength(const ce_handle& event, unsigned short quarterFrames);
    /// Sets the level at one end of the pair that plays at `time`. False where none does.
    bool setShotSound(double time, BeginEnd end, float level);

protected:
    void modification() override;

private:
    IdStamp m_levels;
    bool m_output = true;
    bool m_xfades = false;
    Qx::Ptr<cel> m_xfadeCels[2];
    uint64_t m_xfadeChangeCount = 0; ///< `cel::changeCount` that the helper cels were made for
};
