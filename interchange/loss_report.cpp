#include "interchange/loss_report.h"

#include <algorithm>

namespace interchange {

namespace {

struct Entry {
    const Loss* loss;
    const char* kind;
};

} // namespace

std::vector<String> LossReport::lines() const {
    std::vector<Entry> entries;
    entries.reserve(m_losses.size() + m_warnings.size() + m_notes.size() + m_errors.size());
    const auto add = [&entries](const std::vector<Loss>& all, const char* kind) {
        for (const Loss& loss : all) {
            entries.push_back({&loss, kind});
        }
    };
    add(m_errors, "error");
    add(m_losses, "loss");
    add(m_warnings, "warning");
    add(m_notes, "note");
    std::stable_sort(entries.begin(), entries.end(),
                     [](const Entry& a, const Entry& b) { return a.loss->line < b.loss->line; });
    std::vector<String> texts;
    texts.reserve(entries.size());
    for (const Entry& entry : entries) {
        String text = m_file;
        if (entry.loss->line > 0) {
            text += ":" + std::to_string(entry.loss->line);
        }
        texts.push_back(text + ": " + entry.kind + ": " + entry.loss->what);
    }
    return texts;
}

} // namespace interchange
