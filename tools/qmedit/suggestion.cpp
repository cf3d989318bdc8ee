#include "tools/qmedit/suggestion.h"

#include <algorithm>
#include <utility>
#include <vector>

namespace {

/// Longer words are names that nobody types by heart.
constexpr size_t kLongest = 64;

/// How many single-letter changes make `b` of `a`; both are at most `kLongest` bytes.
size_t distance(const String& a, const String& b) {
    std::vector<size_t> before; // the rows for one and two letters of `a` less
    std::vector<size_t> last(b.size() + 1);
    std::vector<size_t> row(b.size() + 1);
    for (size_t j = 0; j <= b.size(); ++j) {
        row[j] = j;
    }
    for (size_t i = 1; i <= a.size(); ++i) {
        before = std::exchange(last, row);
        row[0] = i;
        for (size_t j = 1; j <= b.size(); ++j) {
            const size_t changed = last[j - 1] + (a[i - 1] == b[j - 1] ? 0 : 1);
            row[j] = std::min({changed, last[j] + 1, row[j - 1] + 1});
            if (i > 1 && j > 1 && a[i - 1] == b[j - 2] && a[i - 2] == b[j - 1]) {
                row[j] = std::min(row[j], before[j - 2] + 1);
            }
        }
    }
    return row[b.size()];
}

} // namespace

String nearestWord(const String& word, std::span<const String> known) {
    const String lower = word.lower();
    // A third of the letters may be wrong, at least one.
    size_t least = std::max<size_t>(word.size() / 3, 1) + 1;
    String nearest;
    for (const String& candidate : known) {
        if (candidate.empty() || std::max(candidate.size(), word.size()) > kLongest) {
            continue;
        }
        if (const size_t changes = distance(lower, candidate.lower()); changes < least) {
            least = changes;
            nearest = candidate;
        }
    }
    return nearest;
}

String didYouMean(const String& word, std::span<const String> known, const String& otherwise) {
    const String nearest = nearestWord(word, known);
    return nearest.empty() ? otherwise : String("; did you mean '" + nearest + "'?");
}
