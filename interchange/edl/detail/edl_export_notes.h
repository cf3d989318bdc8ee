#pragma once

#include "interchange/edl/detail/edl_sources.h"
#include "interchange/edl/edl_reader.h"

namespace interchange::detail {

/// An event line on its way into a list.
struct ExportLine {
    EdlEvent event;
    const EdlSource* source = nullptr; ///< null where only a reel is known
    String name;                       ///< of its clip; empty when reel or source file say it
};

/// True for a line that reads as a note wherever it stands in a list.
bool isWritableNote(std::string_view line);
/// The lines of a text that do, joined by line feeds.
String writableNotes(std::string_view lines);

/// True if the digits of an M2 say exactly this speed factor.
bool speedIs(const String& digits, double velocity, Qx::FrameRate rate);

/// Makes the notes of an event, one line or a pair, say what its lines mean. Notes that do already stay as
/// they are; otherwise those on tracks, speeds and names are written afresh, before the others. False if even
/// then the lines read otherwise than they are meant.
bool settleNotes(std::vector<ExportLine>& lines, Qx::FrameRate rate);

} // namespace interchange::detail
