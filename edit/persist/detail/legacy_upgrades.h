#pragma once

#include "edit/model/edit.h"
#include "platform/media/tv_standard.h"

class TextFile;

/// The television standard that a legacy text names in the "tvtype" line of its header, else the one that
/// follows from its frame rate.
[[nodiscard]] Qx::Ed2Support::TVStd getNamedStandard(const TextFile& file);

/// "3 level ramps" and what became of them; the noun in its singular.
[[nodiscard]] String countedText(int count, const char* noun, const char* what);

/// Calls `visit(stamp, cel)` for every channel with a cel that passes a filter.
template <typename Visit>
void forEachCel(Edit& edit, Edit_Chan_Type type, Visit visit) {
    Vector<IdStamp> chans;
    edit.getChans(chans, type);
    for (const IdStamp& chan : chans) {
        if (cel* content = edit.getCel(chan)) {
            visit(chan, *content);
        }
    }
}

/// What a conversion must not change, remembered over it.
class RememberedFlags {
public:
    explicit RememberedFlags(const Edit& edit);
    /// Puts the values back; a key that was not there goes again.
    void restore(Edit& edit) const;

private:
    bool m_hadSequence, m_hadFrameBased, m_hadTransfer;
    int m_sequence, m_frameBased, m_transfer;
};
