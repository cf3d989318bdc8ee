#pragma once

#include "edit/model/channel_types.h"
#include "platform/base/export.h"
#include "platform/base/vector.h"

/// A list of numbers.
using intlist = Vector<int>;

/// One record of a `ChannelIndexList`: a channel's index. Owned by its list.
class QM_API ListedChanIndex {
public:
    explicit ListedChanIndex(int32_t chan) : m_chan(chan) {}
    virtual ~ListedChanIndex();
    ListedChanIndex(const ListedChanIndex&) = delete;
    ListedChanIndex& operator=(const ListedChanIndex&) = delete;

    [[nodiscard]] int32_t getChan() const { return m_chan; }
    /// The neighbours in the list; null at its ends.
    [[nodiscard]] const ListedChanIndex* next() const { return m_next; }
    [[nodiscard]] const ListedChanIndex* previous() const { return m_previous; }

private:
    friend class ChannelIndexList;

    int32_t m_chan;
    ListedChanIndex* m_next = nullptr;
    ListedChanIndex* m_previous = nullptr;
};

/// An ordered list of channel indices, linked both ways; owns its records. Not thread-safe.
class QM_API ChannelIndexList {
public:
    ChannelIndexList() = default;
    /// One record for each value of `chans`, holding value + `offset`, in order; none for a null list.
    ChannelIndexList(const intlist* chans, int offset);
    ChannelIndexList(const ChannelIndexList& other);
    ChannelIndexList& operator=(const ChannelIndexList& other);
    virtual ~ChannelIndexList();

    void append(int chan);
    void clear();
    [[nodiscard]] unsigned size() const { return m_size; }
    [[nodiscard]] const ListedChanIndex* first() const { return m_first; }
    [[nodiscard]] const ListedChanIndex* last() const { return m_last; }
    /// The first record that holds a channel; null if none.
    [[nodiscard]] const ListedChanIndex* find(int chan) const;
    /// The channel of the `i`-th record, from 0; `NO_CHAN` when there are fewer.
    [[nodiscard]] int getChan(int i) const;

private:
    ListedChanIndex* m_first = nullptr;
    ListedChanIndex* m_last = nullptr;
    unsigned m_size = 0;
};
