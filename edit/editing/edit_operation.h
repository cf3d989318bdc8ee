#pragma once

#include "edit/model/edit_modification.h"
#include "platform/base/export.h"

#include <string_view>

/// What an editing operation does to the selected channels of a destination. The numbers are those of the
/// change descriptions in edit headers: do not change them.
///
/// Each is drawn before and after: one character a second, an upper-case letter for each source in the
/// destination, a lower-case one for what is laid, '.' for black. '[' and ']' stand over the first second
/// behind an in mark and an out mark, '^' over the first second behind the current time. The source is
/// "ddee", marked over its second and third second: its region is "de". The earlier of two marks is the in
/// mark, whichever it was set as.
///
///      1 Replace             ^                       The source region overwrites from the in mark, else
///                          AAAABBB  ->  AAdeBBB      the current time.
///      2 ReplaceMarked       [  ]                    The source overwrites exactly the marked region, from
///                          AAAABBB  ->  AAdeeBB      its in mark, else its current time, on.
///      3 Insert              ^                       The source region comes in at the in mark, else the
///                          AAAABBB  ->  AAdeAABBB    current time; what follows moves.
///      4 Remove              [  ]                    The marked region goes; what follows closes up.
///                          AAAABBB  ->  AABB
///      5 InsertMarked        [  ]                    As Insert, of the destination's marked length.
///                          AAAABBB  ->  AAdeeAABBB
///      6 ReplaceToEnd        ^                       As Replace, and the destination ends with the source.
///                          AAAABBB  ->  AAde
///      7 Lift                [  ]                    The marked region becomes black; nothing moves.
///                          AAAABBB  ->  AA...BB
///      8 SwapTracks          [  ]                    The marked regions of two channels of one kind change
///                          AAAABBB  ->  AACCDBB      places.
///                          CCCCDDD  ->  CCAABDD
///      9 BackReplace             ^                   As Replace, laid so that the source's out meets the out
///                          AAAABBB  ->  AAAdeBB      mark, else the current time ('^' at 5 here).
///     10 BackReplaceMarked   [  ]                    As ReplaceMarked, aligned at the out marks: with the
///                          AAAABBB  ->  AAddeBB      source's out mark is where it ends.
///     11 CopyTrack           [  ]                    The first selected channel's region overwrites the same
///                          AAAABBB  ->  AAAABBB      region of the others of its kind.
///                          CCCCDDD  ->  CCAABDD
///     12 MoveTrack           [  ]                    As CopyTrack, and the first becomes black there.
///                          AAAABBB  ->  AA...BB
///                          CCCCDDD  ->  CCAABDD
///     13 FillBlack           ^                       As Replace, but the source appears only where the
///                          AAA.BBB  ->  AAAeBBB      destination is black, and not behind the later of two
///                                                    different marks of the destination.
///     14 BackInsert            ^                     As Insert, so that the inserted region ends at the out
///                          AAAABBB  ->  AdeAAABBB    mark, else the current time ('^' at 3 here).
///     15 BackInsertMarked    [  ]                    As InsertMarked, so that the inserted region ends at
///                          AAAABBB  ->  AAddeAABBB   the out mark and with the source's out mark.
///     16 ReplaceMaterial     ^                       As Replace, but effects, fades, levels and stamps of
///                          AAAABBB  ->  AAdeBBB      what is overwritten stay: only the material changes.
enum class edit_operation : int {
    NoOperation = 0, ///< nothing: refused
    Replace = 1,
    ReplaceMarked = 2,
    Insert = 3,
    Remove = 4,
    InsertMarked = 5,
    ReplaceToEnd = 6,
    Lift = 7,
    SwapTracks = 8,
    BackReplace = 9,
    BackReplaceMarked = 10,
    CopyTrack = 11,
    MoveTrack = 12,
    FillBlack = 13,
    BackInsert = 14,
    BackInsertMarked = 15,
    ReplaceMaterial = 16
};

/// \name The cores: what is done to one channel
/// @{
inline constexpr edit_operation kCoreReplace = edit_operation::ReplaceMarked;
inline constexpr edit_operation kCoreInsert = edit_operation::Insert;
inline constexpr edit_operation kCoreRemove = edit_operation::Remove;
/// @}

/// The number of values.
inline constexpr int kNumEditOperations = 17;

/// What is done to each channel's cel: `kCoreReplace`, `kCoreInsert`, `kCoreRemove`, or the operation itself.
[[nodiscard]] QM_API edit_operation getCoreEditOperation(edit_operation op);
/// True if it works from a source module into a destination module, else within the destination alone.
[[nodiscard]] QM_API bool editOpRequiresSourceAndDest(edit_operation op);
/// True if it works between channels of one edit.
[[nodiscard]] QM_API bool editOpIsInterTrack(edit_operation op);
/// True if it is aligned at the out marks.
[[nodiscard]] QM_API bool editOpIsBackwards(edit_operation op);
/// True if material is inserted or removed, so that what follows moves.
[[nodiscard]] QM_API bool editOpAffectsTrackSync(edit_operation op);
[[nodiscard]] QM_API bool editOpCanAffectTrackLength(edit_operation op);
/// True if what it removes or overwrites is kept in the clipboard edit: unless the core is an insert.
[[nodiscard]] QM_API bool editOpRequiresClipboard(edit_operation op);

/// "Replace", "InsertMarked" and so on; empty for a number that is none.
[[nodiscard]] QM_API std::string_view editOperationName(edit_operation op);
/// Reads a name as users write it, without regard to case and to '-' and '_' ("insert-marked"), or a number
/// from 0 to 16. False, leaving `op`, for anything else.
[[nodiscard]] QM_API bool editOperationFromText(std::string_view text, edit_operation& op);
/// The change that an operation is described as; `kNoModification` for 0 and for a number that is none.
[[nodiscard]] QM_API EditModificationType editModificationOf(edit_operation op);
