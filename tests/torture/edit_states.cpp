#include "edit_states.h"

#include "edit/model/cel.h"
#include "edit/model/cue_list.h"
#include "edit/model/edit.h"
#include "edit/persist/edit_salvage.h"
#include "platform/services/atomic_file.h"

#include <algorithm>
#include <filesystem>

namespace torture {

namespace fs = std::filesystem;

String digestOf(const std::string& path) {
    std::error_code ignored;
    if (!fs::exists(fs::symlink_status(path, ignored))) {
        return {};
    }
    if (!fs::is_regular_file(fs::symlink_status(path, ignored))) {
        return kDamaged;
    }
    EditPtr edit;
    Vector<String> lost;
    if (!salvageEdit(path, edit, lost) || !lost.empty()) {
        return kDamaged;
    }
    String content;
    for (int i = 0; i < edit->getNumChans(); ++i) {
        content += edit->getChanName(edit->getId(i)) + ":";
        const cel* const its = edit->get_edit_cel_p(i);
        for (int k = 0; its != nullptr && k < its->numEvents(); ++k) {
            const channel_event event = its->get_event(k);
            content += Qx::doubleToText(event.editTime) + " " + Qx::doubleToText(event.stripTime) + " " +
                       event.strip.asString() + ",";
        }
    }
    content += String::format("%zu", edit->get_cues().get_num_cue_points(0));
    return String::format("%s:%04zx", edit->getName().c_str(), std::hash<std::string>()(content) & 0xffff);
}

ProjectStates statesOf(const std::string& projectFolder) {
    ProjectStates states;
    std::error_code error;
    for (fs::recursive_directory_iterator at(projectFolder, error), end; at != end; at.increment(error)) {
        const std::string name = at->path().filename().string();
        const bool counts = name.find(".qme") != std::string::npos ||
                            at->path().parent_path().parent_path().filename() == "Milestones";
        if (counts && !Qx::isTemporaryName(name) && !at->is_directory(error)) {
            states[at->path().lexically_relative(projectFolder).string()] = digestOf(at->path().string());
        }
    }
    return states;
}

String textOf(const ProjectStates& states) {
    String text;
    for (const auto& [path, digest] : states) {
        text += (text.empty() ? "" : ", ") + path + "=" + digest;
    }
    return text;
}

String differenceOf(const ProjectStates& before, const ProjectStates& after) {
    String text;
    for (const auto& [path, digest] : before) {
        const auto found = after.find(path);
        if (found == after.end()) {
            text += " -" + path + "=" + digest;
        } else if (found->second != digest) {
            text += " " + path + ": " + digest + " -> " + found->second;
        }
    }
    for (const auto& [path, digest] : after) {
        if (!before.contains(path)) {
            text += " +" + path + "=" + digest;
        }
    }
    return text;
}

bool holds(const ProjectStates& states, const String& digest) {
    return std::any_of(states.begin(), states.end(),
                       [&](const auto& state) { return state.second == digest; });
}

size_t numTemporaries(const std::string& folder) {
    size_t count = 0;
    std::error_code error;
    for (fs::recursive_directory_iterator at(folder, error), end; at != end; at.increment(error)) {
        count += Qx::isTemporaryName(at->path().filename().string()) ? 1 : 0;
    }
    return count;
}

} // namespace torture
