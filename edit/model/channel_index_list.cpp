#include "edit/model/channel_index_list.h"

ListedChanIndex::~ListedChanIndex() = default;

ChannelIndexList::ChannelIndexList(const intlist* chans, int offset) {
    if (chans != nullptr) {
        for (const int chan : *chans) {
            append(chan + offset);
        }
    }
}

ChannelIndexList::ChannelIndexList(const ChannelIndexList& other) {
    *this = other;
}

ChannelIndexList& ChannelIndexList::operator=(const ChannelIndexList& other) {
    if (this != &other) {
        clear();
        for (const ListedChanIndex* record = other.m_first; record != nullptr; record = record->m_next) {
            append(record->m_chan);
        }
    }
    return *this;
}

ChannelIndexList::~ChannelIndexList() {
    clear();
}

void ChannelIndexList::append(int chan) {
    auto* record = new ListedChanIndex(chan);
    record->m_previous = m_last;
    (m_last != nullptr ? m_last->m_next : m_first) = record;
    m_last = record;
    ++m_size;
}

void ChannelIndexList::clear() {
    while (m_first != nullptr) {
        const ListedChanIndex* record = m_first;
        m_first = m_first->m_next;
        delete record;
    }
    m_last = nullptr;
    m_size = 0;
}

const ListedChanIndex* ChannelIndexList::find(int chan) const {
    const ListedChanIndex* record = m_first;
    while (record != nullptr && record->m_chan != chan) {
        record = record->m_next;
    }
    return record;
}

int ChannelIndexList::getChan(int i) const {
    const ListedChanIndex* record = i >= 0 ? m_first : nullptr;
    for (; record != nullptr && i > 0; --i) {
        record = record->m_next;
    }
    return record != nullptr ? record->m_chan : NO_CHAN;
}
