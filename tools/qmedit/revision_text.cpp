#include "tools/qmedit/revision_text.h"

#include "tools/qmedit/column_table.h"
#include "tools/qmedit/console.h"

#include <ctime>

namespace {

std::vector<String> cells(const Revision& revision, const Console& console) {
    return {console.safe(revision.which), localTimeText(revision.time),
            String(std::to_string(revision.file.size)),
            revision.isSound() ? String(std::to_string(revision.modifications)) : String("-"),
            revision.isSound() ? (revision.change.empty() ? String("-") : console.safe(revision.change))
                               : "damaged: " + console.safe(revision.damage)};
}

} // namespace

String revisionTable(const std::vector<Revision>& revisions, const Console& console) {
    constexpr bool rightAligned[] = {false, false, true, true, false};
    ColumnTable table({"which", "changed", "bytes", "count", "last change"}, rightAligned);
    for (const Revision& revision : revisions) {
        table.add(cells(revision, console), !revision.isSound()                 ? Console::Ink::Warning
                                            : revision.kind == Revision::Itself ? Console::Ink::Bold
                                                                                : Console::Ink::None);
    }
    return table.text(console, false);
}

bool reportUnanswered(const RevisionList& list) {
    for (const String& what : list.unanswered) {
        reportWarning("not every state could be looked at: " + what);
    }
    return !list.unanswered.empty();
}

String localTimeText(int64_t seconds) {
    const auto time = static_cast<std::time_t>(seconds);
    std::tm fields{};
    char text[32];
    if (seconds <= 0 || localtime_r(&time, &fields) == nullptr ||
        std::strftime(text, sizeof text, "%Y-%m-%d %H:%M", &fields) == 0) {
        return "-";
    }
    return text;
}
