#include "interchange/import.h"

#include "edit/model/cel.h"
#include "edit/model/channel_event.h"
#include "interchange/detail/strip_map.h"
#include "interchange/edl/edl_records.h"
#include "platform/base/num_range.h"
#include "platform/store/configb.h"

#include <algorithm>
#include <cmath>
#include <unordered_map>

namespace interchange {

namespace {

/// What tells the source of a shot.
constexpr const char* kTellingKeys[] = {EdlKey::kReel, EdlKey::kSourceFile, EdlKey::kMediaPath};

bool isOneSource(const Edit& known, const Edit& wanted) {
    const bool sameTexts =
        std::all_of(std::begin(kTellingKeys), std::end(kTellingKeys), [&](const char* key) {
            return known.Opts().getString(key) == wanted.Opts().getString(key);
        });
    return sameTexts && known.getName() == wanted.getName() &&
           known.getFrameRate() == wanted.getFrameRate() &&
           known.isDropFrame(false) == wanted.isDropFrame(false) &&
           known.get_log_type() == wanted.get_log_type();
}

/// A reel that says nothing but that there is a source.
bool isUnknown(const Edit& shot) {
    const String reel = shot.Opts().getString(EdlKey::kReel);
    return reel.empty() || (String::equalNoCase(reel, "AX") && shot.getName() == reel);
}

/// True if one pair of `known` plays all that the pairs of `wanted` play, from the same times.
bool covers(const cel* known, const cel& wanted) {
    for (int i = 0; i + 1 < wanted.numEvents(); i += 2) {
        const channel_event in = wanted.get_event(i);
        const channel_event out = wanted.get_event(i + 1);
        bool isThere = false;
        for (int k = 0; known != nullptr && k + 1 < known->numEvents() && !isThere; k += 2) {
            const channel_event from = known->get_event(k);
            const channel_event to = known->get_event(k + 1);
            isThere = from.strip.type() == in.strip.type() && from.velocity == in.velocity &&
                      from.editTime <= in.editTime + Qx::kTimeTolerance &&
                      to.editTime >= out.editTime - Qx::kTimeTolerance &&
                      std::abs((in.editTime - from.editTime) - (in.stripTime - from.stripTime)) <=
                          Qx::kTimeTolerance;
        }
        if (!isThere) {
            return false;
        }
    }
    return true;
}

bool holdsAll(Edit& known, Edit& wanted) {
    for (const Edit_Chan_Type type : {VideoChan, AudioChan}) {
        Vector<int> there;
        Vector<int> needed;
        known.getChans(there, type, Edit_Chan_SubType::NONE);
        wanted.getChans(needed, type, Edit_Chan_SubType::NONE);
        for (size_t i = 0; i < needed.size(); ++i) {
            const cel* const content = wanted.get_edit_cel_p(needed[i]);
            const cel* const own = i < there.size() ? known.get_edit_cel_p(there[i]) : nullptr;
            if (content != nullptr && !covers(own, *content)) {
                return false;
            }
        }
    }
    return true;
}

} // namespace

size_t reuseShots(Import& result, const ShotsOfName& shotsOfName) {
    detail::CookieMap found;
    std::unordered_map<std::string, std::vector<EditPtr>> known;
    std::vector<EditPtr> fresh;
    for (EditPtr& shot : result.shots) {
        cookie match = invalid_cookie;
        if (!isUnknown(*shot)) {
            const auto [place, added] = known.try_emplace(shot->getName());
            if (added) {
                place->second = shotsOfName(shot->getName());
            }
            for (EditPtr& candidate : place->second) {
                if (isOneSource(*candidate, *shot) && holdsAll(*candidate, *shot)) {
                    match = candidate->get_cookie();
                    break;
                }
            }
        }
        if (match.isStorable()) {
            found.emplace(shot->get_cookie(), match);
            result.reused.push_back(match);
        } else {
            fresh.push_back(std::move(shot));
        }
    }
    result.shots = std::move(fresh);
    if (!found.empty()) {
        detail::mapStrips(*result.sequence, found);
    }
    return found.size();
}

} // namespace interchange
