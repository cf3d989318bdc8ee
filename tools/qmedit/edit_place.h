#pragma once

#include "edit/inspect/edit_report.h"
#include "platform/base/status.h"

/// A place in an edit as users write it: "COOKIE", "COOKIE@IN", "COOKIE@IN-OUT" or "COOKIE@-OUT".
struct EditPlace {
    String name; ///< the cookie or the name of the edit, as it was written
    cookie item; ///< once it was found
    String in;   ///< a time as it was written; empty for none
    String out;  ///< likewise
};

/// Takes the text apart; an '@' with no time behind it is a part of the name. The edit is not looked for and
/// the times are not read yet. A failure says what is wrong with the text.
Qx::Status parsePlace(const String& text, EditPlace& place);

/// Reads a time of an edit: record timecode ("10:00:05:00", with ';' drop frame), frames ("125f") or seconds
/// ("5s", "2.5s") from the edit's time 0, in a shot from its beginning. Gives seconds of edit time.
Qx::Status parseEditTime(const String& text, const EditReport& report, double& seconds);

/// The channel of a report that a place names, in any case: "V1", "a2". Null when there is none.
[[nodiscard]] const ChannelReport* findChannel(const EditReport& report, const String& place);
