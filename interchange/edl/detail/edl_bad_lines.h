#pragma once

#include "interchange/loss_report.h"
#include "platform/base/status.h"

namespace interchange::detail {

/// The lines of a list that cannot be taken as they are, all of them met before the first is told of.
class EdlBadLines {
public:
    /// `what` says why, and what to do.
    void add(int line, String what);
    [[nodiscard]] bool empty() const { return m_lines.empty(); }

    /// Each becomes an error of the report. The failure names the first and counts the others.
    [[nodiscard]] Qx::Status refuse(LossReport& report);
    /// Each becomes a loss of the report, as it is left out.
    void leaveOut(LossReport& report);

private:
    /// The lines in order, each handed to `tell`, then one that counts the others.
    template <class Tell>
    void tellAll(const Tell& tell);

    std::vector<Loss> m_lines; ///< the first that were met
    size_t m_more = 0;         ///< how many others there are
    int m_firstMore = 0;       ///< the line of the first of these
};

} // namespace interchange::detail
