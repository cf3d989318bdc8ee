#pragma once

#include <string_view>

namespace interchange::detail {

/// What a note line is about.
enum class NoteKind {
    Other, ///< kept as text
    FromClipName,
    ToClipName,
    KeyClipName,
    MediaFrom,
    MediaTo,
    SourceFile,
    FullReel, ///< "FINAL CUT PRO REEL: long-name REPLACED BY: SHORT"
    Marker,
    FreezeFrame,
    EffectName, ///< of a transition or another effect
    Audio,
    Speed,
    Split
};

struct Note {
    NoteKind kind = NoteKind::Other;
    std::string_view value; ///< behind the keyword, without the blanks at its ends
};

/// Classes a note line: the stars in front, the blank behind them and the colon after the keyword may each be
/// missing. The views point into `line`.
Note parseNote(std::string_view line);

/// The first blank-separated word of `text`, which is left without it.
std::string_view takeWord(std::string_view& text);

} // namespace interchange::detail
