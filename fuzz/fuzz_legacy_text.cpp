// Any text as a legacy text: refused whole, or an edit whose own text reads again and is then the same.

#include "edit/model/cue_list.h"
#include "edit/model/edit.h"
#include "fuzz/memory_file.h"
#include "platform/services/log.h"
#include "platform/store/text_file.h"

#include <cstdlib>

namespace {

String textOf(const Edit& edit) {
    TextFile text;
    const auto standard = edit.writeED2Config(text);
    edit.writeED2Cues(text);
    edit.writeED2Cels(text, standard);
    return text.text();
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    Qx::setLogSink([](std::string_view) {});
    Qx::setStandardOutputSink([](std::string_view) {});
    test::MemoryFile file(std::string(reinterpret_cast<const char*>(data), size));
    Edit edit;
    if (!edit.readFromLegacyFile(L"/E0001000.ed2")) {
        if (edit.getNumChans() != 0 || edit.lastFileError().empty()) {
            std::abort();
        }
        return 0;
    }
    for (int i = 0; i < edit.getNumChans(); ++i) {
        const cel* content = edit.get_edit_cel_p(i);
        if (content != nullptr && content->is_good_cel() == 0) {
            std::abort();
        }
    }
    if (edit.getNumChans(VideoChan) == 0) {
        return 0; // has no text
    }
    const cue_list& cues = edit.get_cues();
    if (cues.get_num_cue_points(CueFlag::kKept) != cues.get_num_cue_points(0)) {
        return 0; // as many cues are written as are kept, from the first on, whether these are or not
    }
    file.setBytes(textOf(edit));
    Edit again;
    if (!again.readFromLegacyFile(L"/E0001000.ed2")) {
        std::abort();
    }
    const String second = textOf(again);
    file.setBytes(second);
    Edit third;
    if (!third.readFromLegacyFile(L"/E0001000.ed2") || textOf(third) != second) {
        std::abort();
    }
    return 0;
}
