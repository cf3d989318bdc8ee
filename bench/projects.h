#pragma once

#include "edit/model/edit_ptr.h"
#include "platform/base/cookie.h"

#include <vector>

namespace bench {

/// The projects that measures of the manager work in.
enum class Project {
    Few, ///< what measures of single edits make
    Many ///< 10 000 small edits, made when it is first entered
};

/// Makes a project the current one, with a manager; nothing if it is that already.
void enterProject(Project project);
/// The edits of `Project::Many`, one clip each, in which it enters.
const std::vector<cookie>& manyItems();
/// The base folder that both lie in, and the folder of one of them.
String projectsFolder();
String folderOf(Project project);

} // namespace bench
