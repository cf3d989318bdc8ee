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
    entries.reserve(m_losses.size() + m_warnings.size());
    for (const Loss& loss : m_losses) {
        entries.push_back({&loss, "loss"});
    }
    for (const Loss& warning : m_warnings) {
        entries.push_back({&warning, "warning"});
    }
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
