#pragma once

#include "edit/model/cel_event_pair.h"

/// A pair that walks over its channel:
///
///     for (CelIterator it(edit, chan); it.valid(); it.inc()) { use(it.editTime(), it.stripCookie()); }
///     for (it.moveToEnd(); it.valid(); it.dec()) { ... }
///
/// Remembers the channel by its stamp and finds its cel again when it moves to the start or the end, so it
/// may be moved there after the cel was replaced. A step moves two indices: it allocates nothing and touches
/// no count. An iterator over a cel that nothing shares must not outlive it.
class QM_API CelIterator : public CelEventPair {
public:
    CelIterator() = default;
    /// At the start of a channel; invalid for an unknown or empty one.
    CelIterator(const EditPtr& edit, int chanIdx);
    CelIterator(const EditPtr& edit, const IdStamp& chan);
    /// At the pair that plays at a time; invalid where none does.
    CelIterator(const EditPtr& edit, int chanIdx, double time);
    CelIterator(const EditPtr& edit, const IdStamp& chan, double time);
    /// At the pair of an event of a channel.
    CelIterator(const EditPtr& edit, int chanIdx, const ce_handle& event);
    explicit CelIterator(const CelEventPair& pair);
    /// At the start of a bare cel.
    explicit CelIterator(cel* content);

    /// To the first pair; invalid for an empty channel. Without a channel stamp, of the cel that it walks.
    void moveToStart();
    /// To the last pair; invalid for an empty channel.
    void moveToEnd();
    /// To a given pair, whose edit and channel it takes.
    void moveTo(const CelEventPair& pair);

    [[nodiscard]] const CelEventPair& getEventPair() const { return *this; }
    const CelEventPair& operator*() const { return *this; }
    bool operator==(const CelIterator& other) const { return CelEventPair::operator==(other); }

    /// `NO_CHAN` for an unknown channel; does not ask that the pair be valid.
    [[nodiscard]] int idx() const;
    [[nodiscard]] const EditPtr& getEdit() const { return m_itsEdit; }
    CelIterator& operator++() {
        inc();
        return *this;
    }
    CelIterator& operator--() {
        dec();
        return *this;
    }
    CelIterator operator++(int);
    CelIterator operator--(int);

private:
    [[nodiscard]] cel* findCel() const;

    IdStamp m_stamp;
    EditPtr m_itsEdit;
};
