#include "interchange/edl/detail/edl_bad_lines.h"

#include <algorithm>

namespace interchange::detail {

namespace {

/// A file with more is no list, or was made by a tool that writes every line so.
constexpr size_t kMostTold = 200;

} // namespace

void EdlBadLines::add(int line, String what) {
    if (m_lines.size() < kMostTold) {
        m_lines.push_back({line, std::move(what)});
    } else if (m_more++ == 0) {
        m_firstMore = line;
    }
}

template <class Tell>
void EdlBadLines::tellAll(const Tell& tell) {
    std::stable_sort(m_lines.begin(), m_lines.end(),
                     [](const Loss& a, const Loss& b) { return a.line < b.line; });
    for (const Loss& bad : m_lines) {
        tell(bad.line, bad.what);
    }
    if (m_more > 0) {
        tell(m_firstMore, String::format("this and %zu more lines cannot be read", m_more - 1));
    }
}

Qx::Status EdlBadLines::refuse(LossReport& report) {
    tellAll([&report](int line, const String& what) { report.addError(line, what); });
    const Loss& first = m_lines.front();
    const size_t others = m_lines.size() - 1 + m_more;
    return Qx::Status::failure(
        report.file() + ":" + std::to_string(first.line) + ": " + first.what +
        (others > 0 ? String::format(" (and %zu more line%s)", others, others == 1 ? "" : "s") : String()));
}

void EdlBadLines::leaveOut(LossReport& report) {
    tellAll([&report](int line, const String& what) { report.addLoss(line, "left out: " + what); });
}

} // namespace interchange::detail
