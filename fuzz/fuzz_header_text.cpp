// The text and the packed form of a header store: whatever is read must be written and read again as the
// same.

#include "platform/store/configb.h"
#include "platform/store/pstream.h"
#include "platform/store/text_file.h"

#include <cstdlib>

namespace {

void require(bool holds) {
    if (!holds) {
        std::abort();
    }
}

void checkTextForm(std::string_view input) {
    TextFile text;
    text.setText(input);
    configb header("EDIT", "END_EDIT_HEADER");
    unsigned after = 0;
    if (!header.buildFrom(text, 0, after)) {
        require(header.size() == 0);
        return;
    }
    TextFile written;
    header.writeTo(written);
    TextFile reread;
    reread.setText(written.text());
    configb again("EDIT", "END_EDIT_HEADER");
    require(again.buildFrom(reread, 0, after).isOk() && again == header);
}

void checkPackedForm(std::span<const std::byte> input) {
    PStream stream(input);
    configb header;
    header.unpack(stream);
    if (!stream.good()) {
        require(header.size() == 0);
        return;
    }
    PStream written;
    header.pack(written);
    PStream reread(written.bytes());
    configb again;
    again.unpack(reread);
    require(reread.good() && reread.remaining() == 0 && again == header);
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    const std::span<const uint8_t> bytes(data, size);
    checkTextForm({reinterpret_cast<const char*>(data), size});
    checkPackedForm(std::as_bytes(bytes));
    return 0;
}
