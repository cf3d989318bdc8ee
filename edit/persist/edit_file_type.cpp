#include "edit/model/edit.h"
#include "platform/services/edit_filenames.h"

QxEditFileType getEditFileTypeFromFileName(const WString& name) {
    const String upper = Qx::narrow(name).upper();
    if (upper.ends_with(getEditFilenameExt().upper())) {
        return kObjectStoreFile;
    }
    if (upper.ends_with(".ED3")) {
        return kObjectStoreEd3File;
    }
    return upper.ends_with(".ED2") ? kLegacyTextFile : kUnknownFile;
}
