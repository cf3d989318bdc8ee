// Any bytes as an edit file: refused whole, or an edit that is consistent and says so again.

#include "edit/model/cel.h"
#include "edit/model/edit.h"
#include "fuzz/memory_file.h"
#include "platform/services/log.h"

#include <cstdlib>

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    Qx::setLogSink([](std::string_view) {});
    Qx::setStandardOutputSink([](std::string_view) {});
    const test::MemoryFile file(std::string(reinterpret_cast<const char*>(data), size));
    const Edit edit(L"/E0001000.qme", eOpenExisting);
    if (edit.isBad()) {
        if (edit.getNumChans() != 0 || edit.lastFileError().empty()) {
            std::abort();
        }
        return 0;
    }
    for (int i = 0; i < edit.getNumChans(); ++i) {
        const cel* content = edit.get_edit_cel_p(i);
        if (!edit.getId(i).valid() || (content != nullptr && content->is_good_cel() == 0)) {
            std::abort();
        }
    }
    return 0;
}
