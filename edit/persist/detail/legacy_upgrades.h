#pragma once

#include "platform/media/tv_standard.h"

class Edit;
class TextFile;

/// The television standard that a legacy text names in the "tvtype" line of its header, else the one that
/// follows from its frame rate.
[[nodiscard]] Qx::Ed2Support::TVStd getNamedStandard(const TextFile& file);

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
