#include "edit/model/channel_group_list.h"
#include "fuzz/packed_form.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    return readPackedForm<ChannelGroupList>(data, size);
}
