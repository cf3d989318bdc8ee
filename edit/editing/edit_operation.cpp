#include "edit/editing/edit_operation.h"

#include <array>
#include <string>

namespace {

using Op = edit_operation;

constexpr std::array<std::string_view, kNumEditOperations> kNames = {
    "NoOperation",       "Replace",        "ReplaceMarked", "Insert",     "Remove",
    "InsertMarked",      "ReplaceToEnd",   "Lift",          "SwapTracks", "BackReplace",
    "BackReplaceMarked", "CopyTrack",      "MoveTrack",     "FillBlack",  "BackInsert",
    "BackInsertMarked",  "ReplaceMaterial"};

constexpr char lower(char c) {
    return c >= 'A' && c <= 'Z' ? static_cast<char>(c - 'A' + 'a') : c;
}

/// The text without separators, in lower case, compared with a name.
bool reads(std::string_view text, std::string_view name) {
    size_t at = 0;
    for (const char c : text) {
        if (c == '-' || c == '_') {
            continue;
        }
        if (at >= name.size() || lower(c) != lower(name[at])) {
            return false;
        }
        ++at;
    }
    return at == name.size();
}

} // namespace

edit_operation getCoreEditOperation(edit_operation op) {
    switch (op) {
    case Op::Replace:
    case Op::ReplaceToEnd:
    case Op::BackReplace:
    case Op::BackReplaceMarked:
    case Op::ReplaceMaterial:
        return kCoreReplace;
    case Op::InsertMarked:
    case Op::BackInsert:
    case Op::BackInsertMarked:
        return kCoreInsert;
    default:
        return op;
    }
}

bool editOpRequiresSourceAndDest(edit_operation op) {
    const edit_operation core = getCoreEditOperation(op);
    return core == kCoreReplace || core == kCoreInsert || core == Op::FillBlack;
}

bool editOpIsInterTrack(edit_operation op) {
    return op == Op::SwapTracks || op == Op::CopyTrack || op == Op::MoveTrack;
}

bool editOpIsBackwards(edit_operation op) {
    return op == Op::BackReplace || op == Op::BackReplaceMarked || op == Op::BackInsert ||
           op == Op::BackInsertMarked;
}

bool editOpAffectsTrackSync(edit_operation op) {
    const edit_operation core = getCoreEditOperation(op);
    return core == kCoreInsert || core == kCoreRemove;
}

bool editOpCanAffectTrackLength(edit_operation op) {
    return !editOpIsInterTrack(op) && getCoreEditOperation(op) != Op::Lift;
}

bool editOpRequiresClipboard(edit_operation op) {
    return getCoreEditOperation(op) != kCoreInsert;
}

std::string_view editOperationName(edit_operation op) {
    const int number = static_cast<int>(op);
    return number >= 0 && number < kNumEditOperations ? kNames[static_cast<size_t>(number)]
                                                      : std::string_view();
}

bool editOperationFromText(std::string_view text, edit_operation& op) {
    for (int number = 0; number < kNumEditOperations; ++number) {
        if (text == std::to_string(number) || reads(text, kNames[static_cast<size_t>(number)])) {
            op = static_cast<edit_operation>(number);
            return true;
        }
    }
    return false;
}

EditModificationType editModificationOf(edit_operation op) {
    const bool known = op > Op::NoOperation && static_cast<int>(op) < kNumEditOperations;
    return known ? static_cast<EditModificationType>(op) : kNoModification;
}
