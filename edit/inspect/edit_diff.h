#pragma once

#include "edit/inspect/edit_report.h"
#include "edit/inspect/moved_run.h"

#include <vector>

/// What differs between two edits, taken from their reports. Channels correspond by kind and by their place
/// among those of the kind: V2 is compared with V2, whatever they are called.

enum class DiffKind { Changed, Added, Removed };

/// For a thing that at least one of the two edits has.
[[nodiscard]] QM_API DiffKind diffKind(bool wasThere, bool isThere);

/// How one channel differs.
struct ChannelDiff {
    struct Span {
        double from = 0;
        double to = 0;
    };
    String name; ///< kind letter and place: "V1"
    DiffKind kind = DiffKind::Changed;
    std::vector<Span> spans; ///< edit times at which the two play something else, in order; of a changed one
    std::vector<PairReport> removed;         ///< pairs that the first has and the second has not, in order
    std::vector<PairReport> added;           ///< and the other way round
    std::vector<MovedRun<PairReport>> moved; ///< pairs that both have, at other times
    double endBefore = 0;                    ///< seconds at which the last pair ends
    double endAfter = 0;
};

struct EditDiff {
    std::vector<ChannelDiff> channels; ///< those that differ, in the order of the channel index
    size_t cuesBefore = 0;
    size_t cuesAfter = 0;
    std::vector<CueReport> cuesRemoved;         ///< markers that only the first has, in order
    std::vector<CueReport> cuesAdded;           ///< and those that only the second has
    std::vector<MovedRun<CueReport>> cuesMoved; ///< those that both have, at other times
    [[nodiscard]] bool cuesDiffer() const {
        return !cuesRemoved.empty() || !cuesAdded.empty() || !cuesMoved.empty();
    }
    [[nodiscard]] bool same() const { return channels.empty() && !cuesDiffer(); }
};

/// Compares two edits, of one project or of two. Sources are told apart by their cookies alone: neither names
/// nor what lies in the files of the sources count.
[[nodiscard]] QM_API EditDiff diffOf(const EditReport& before, const EditReport& after);
