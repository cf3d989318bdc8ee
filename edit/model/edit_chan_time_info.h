#pragma once

#include "platform/base/export.h"
#include "platform/base/id_stamp.h"

/// Position of a caller on one channel. Equal when the channels are.
class QM_API EditChanTimeInfo {
public:
    EditChanTimeInfo() = default;
    EditChanTimeInfo(const IdStamp& chan, double current, bool markValid, double mark)
        : m_chan(chan), m_current(current), m_markValid(markValid), m_mark(mark) {}
    [[nodiscard]] bool valid() const { return m_chan.valid(); }
    [[nodiscard]] const IdStamp& getChanId() const { return m_chan; }
    void setChanId(const IdStamp& chan) { m_chan = chan; }
    [[nodiscard]] double getCurrentTime() const { return m_current; }
    void setCurrentTime(double time) { m_current = time; }
    [[nodiscard]] double getMarkTime() const { return m_mark; }
    [[nodiscard]] bool isMarkValid() const { return m_markValid; }
    bool operator==(const EditChanTimeInfo& other) const { return m_chan == other.m_chan; }

private:
    IdStamp m_chan;
    double m_current = 0;
    bool m_markValid = false;
    double m_mark = 0;
};
