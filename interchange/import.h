#pragma once

#include "edit/model/edit_ptr.h"
#include "interchange/export.h"
#include "interchange/loss_report.h"
#include "platform/base/status.h"
#include "platform/media/frame_rate.h"

#include <functional>
#include <vector>

/// What an importer of another tool's timeline makes, and how it becomes part of the current project. The
/// importers themselves only build edits in memory; what a sequence or a shot is made of is their business.
namespace interchange {

struct ImportOptions {
    Qx::FrameRate rate;   ///< of the timeline, where its form does not state one
    bool strict = false;  ///< overlaps and the like are failures instead of warnings
    bool skipBad = false; ///< what of it cannot be read is left out, a loss each, instead of a failure
};

/// A sequence and the shots that it plays, not yet part of a project.
///
/// Until they are saved the edits have the cookies of `provisionalCookie` and are dirty. A pair of the
/// sequence names the shot it plays by the shot's cookie. A shot's own pairs name its media: the shot's words
/// with kind 'V' for picture and 'S' for sound.
struct Import {
    EditPtr sequence;
    std::vector<EditPtr> shots;
    std::vector<cookie> reused; ///< items of the project that the sequence plays (`reuseShots`)
    LossReport report;
};

/// Looks up the shots of a project that bear a name.
using ShotsOfName = std::function<std::vector<EditPtr>(const String& name)>;

/// Lets the sequence play shots that the project has in the place of those that would repeat them: of the same
/// name, reel, file, media path, frame rate and counting of frames, and holding at least the span that is
/// used of it, on the same tracks. A source that bears the reel "AX" and no other name is never taken for
/// another. The shots that were found go from `result.shots` to `result.reused`; answers how many.
QM_INTERCHANGE_API size_t reuseShots(Import& result, const ShotsOfName& shotsOfName);

/// The cookie of shot `index` of an import that is not saved: of kind 'F', so that nothing stores it.
QM_INTERCHANGE_API cookie provisionalCookie(size_t index);

/// Gives every edit a cookie of the current project, puts these in the place of the provisional ones wherever
/// an event names a shot, and writes the shots, then the sequence, in one batch. No cookie that the edits
/// name as a source from elsewhere is given to one of them, nor to an edit made later. The edits take their
/// names under the writers' lock of the project; what a process that dies on the way leaves,
/// `unfinishedImports` finds.
///
/// A shot that was to be reused and is gone meanwhile is a failure.
///
/// On failure the project is as it was and the import is too, so that the call can be repeated. `cancelled`
/// is asked between the edits, until the first takes its name; once it says true the call fails.
QM_INTERCHANGE_API Qx::Status saveImport(Import& result, const std::function<bool()>& cancelled = nullptr);

} // namespace interchange
