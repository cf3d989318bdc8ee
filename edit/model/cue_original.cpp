#include "edit/model/cue_list.h"
#include "edit/model/cue_point.h"
#include "edit/model/edit.h"
#include "edit/project/permissions_manager.h"

#include <cmath>

bool cue_point::find_original(cookie& source, int& index) const {
    if (!attached() || !m_stripCookie.is_valid() || m_stripCookie.isMagic()) {
        return false;
    }
    const EditPtr item(m_stripCookie, eOpenExisting);
    if (!item.valid()) {
        return false;
    }
    const cue_list& cues = item->get_cues();
    const size_t count = cues.get_num_cue_points(0);
    for (size_t i = 0; i < count; ++i) {
        const cue_point* cue = cues.get_cue_point(i, 0);
        if (cue->text() == text() && std::abs(cue->editTime() - m_stripTime) <= Qx::kTimeTolerance) {
            source = m_stripCookie;
            index = static_cast<int>(i);
            return true;
        }
    }
    return false;
}

bool cue_point::delete_if_original() const {
    cookie source;
    int index = 0;
    if (!find_original(source, index)) {
        return false;
    }
    const EditPtr item(source, eOpenExisting);
    return item.valid() && !item->get_read_only() && !PermissionsManager::getReadOnly(source) &&
           item->deleteCue(static_cast<size_t>(index));
}
