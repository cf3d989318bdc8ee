#include "interchange/edl/edl_import.h"

#include <cstddef>
#include <cstdint>

// The first byte chooses the frame rate, the mode and whether bad lines are left out, the rest is a list.
extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    if (size == 0) {
        return 0;
    }
    const interchange::ImportOptions options{Qx::FrameRate(data[0] % 11), (data[0] & 0x80) != 0};
    const std::string_view text(reinterpret_cast<const char*>(data) + 1, size - 1);
    interchange::EdlList list;
    interchange::Import import;
    import.report.setFile("fuzz.edl");
    const auto bad = (data[0] & 0x40) != 0 ? interchange::BadLines::Skip : interchange::BadLines::Refuse;
    if (interchange::readEdl(text, options.rate, list, import.report, bad)) {
        static_cast<void>(interchange::importEdlList(list, "fuzz", options, import).isOk());
    }
    return 0;
}
