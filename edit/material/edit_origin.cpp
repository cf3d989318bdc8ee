#include "edit/material/qx_umid.h"
#include "edit/model/edit.h"
#include "edit/model/edit_keys.h"
#include "platform/media/picture_format.h"

namespace {

String keyOf(const IdStamp& chan) {
    return String(EditKeys::kTrackOrigin) + chan.asString();
}

} // namespace

QxUMID Edit::getTrackOriginInfo_UMID(const IdStamp& chan) const {
    return getIdx(chan) == NO_CHAN ? QxUMID() : QxUMID(m_header.getString(keyOf(chan)));
}

bool Edit::setTrackOriginInfo(const IdStamp& chan, const QxUMID& umid) {
    if (getIdx(chan) == NO_CHAN) {
        return false;
    }
    const String text = umid.getAsString();
    if (text == m_header.getString(keyOf(chan))) {
        return true;
    }
    if (refusesChange()) {
        return false;
    }
    if (text.empty()) {
        m_header.remove(keyOf(chan));
    } else {
        m_header.setString(keyOf(chan), text);
    }
    recordChange(EditModification(kPropertiesChanged).setChan(chan), true);
    return true;
}

ShotVideoMetadata Edit::getShotVideoMetadata() const {
    return ShotVideoMetadata::fromString(EditKeys::kShotVideo.get(m_header));
}

void Edit::setShotVideoMetadata(const ShotVideoMetadata& metadata) {
    if (metadata.valid()) {
        EditKeys::kShotVideo.set(m_header, metadata.asString());
    } else {
        m_header.remove(EditKeys::kShotVideo);
    }
}
