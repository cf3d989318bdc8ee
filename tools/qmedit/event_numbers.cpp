#include "tools/qmedit/event_numbers.h"

#include "interchange/edl/edl_records.h"
#include "platform/store/configb.h"

#include <unordered_map>

void addEventNumbers(EditReport& report, const Edit& edit) {
    const std::vector<interchange::EdlRecord> records =
        interchange::unpackEdlRecords(edit.Opts().getString(interchange::EdlKey::kEvents));
    std::unordered_map<IdStamp, const String*> numbers;
    for (const interchange::EdlRecord& record : records) {
        for (const IdStamp& stamp : record.events) {
            numbers.emplace(stamp, &record.number);
        }
    }
    if (numbers.empty()) {
        return;
    }
    for (ChannelReport& channel : report.channels) {
        for (PairReport& pair : channel.pairs) {
            if (const auto found = numbers.find(pair.id); found != numbers.end()) {
                pair.event = *found->second;
            }
        }
    }
}
