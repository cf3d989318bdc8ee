#include "tools/qmedit/edit_diff_json.h"

#include "tools/qmedit/edit_diff_text.h"
#include "tools/qmedit/edit_json.h"

#include <nlohmann/json.hpp>

namespace {

using Json = nlohmann::ordered_json;

/// The level as people write it: 0.7, not the nearest float's digits as a double.
Json levelJson(float level) {
    double value = 0;
    return Qx::textToDouble(levelText(level), value) ? Json(value) : Json();
}

Json differingPairJson(const EditReport& report, const PairReport& pair) {
    Json json = Json::parse(pairJsonText(report, pair));
    json["level_in"] = levelJson(pair.begin.level);
    json["level_out"] = levelJson(pair.end.level);
    json["curve_in"] = pair.begin.curve;
    json["curve_out"] = pair.end.curve;
    json["code_in"] = pair.begin.code;
    json["code_out"] = pair.end.code;
    return json;
}

template <class Range, class ToJson>
Json listJson(const Range& range, const ToJson& toJson) {
    Json list = Json::array();
    for (const auto& element : range) {
        list.push_back(toJson(element));
    }
    return list;
}

/// Things that moved, in frames and seconds of the first edit.
template <class Element>
Json movedJson(const std::vector<MovedRun<Element>>& moved, const EditReport& before) {
    return listJson(moved, [&](const MovedRun<Element>& run) {
        return Json{{"count", run.count},
                    {"from", before.frames(run.from)},
                    {"to", before.frames(run.to)},
                    {"by", before.frames(run.by)},
                    {"from_s", run.from},
                    {"to_s", run.to},
                    {"by_s", run.by},
                    {"rest", run.isRest}};
    });
}

Json channelJson(const ChannelDiff& channel, const EditReport& before, const EditReport& after) {
    Json json;
    json["channel"] = static_cast<const std::string&>(channel.name);
    json["change"] = diffKindText(channel.kind);
    json["end_before"] = before.frames(channel.endBefore);
    json["end_before_s"] = channel.endBefore;
    json["end_after"] = after.frames(channel.endAfter);
    json["end_after_s"] = channel.endAfter;
    json["spans"] = listJson(channel.spans, [&](const ChannelDiff::Span& span) {
        return Json{{"from", after.frames(span.from)},
                    {"to", after.frames(span.to)},
                    {"from_s", span.from},
                    {"to_s", span.to}};
    });
    json["removed"] =
        listJson(channel.removed, [&](const PairReport& pair) { return differingPairJson(before, pair); });
    json["added"] =
        listJson(channel.added, [&](const PairReport& pair) { return differingPairJson(after, pair); });
    json["moved"] = movedJson(channel.moved, before);
    return json;
}

Json valueJson(const std::optional<configb::Value>& value) {
    return value ? Json::parse(valueJsonText(*value)) : Json();
}

Json valuesJson(const std::vector<ValueDiff>& values, const char* key) {
    return listJson(values, [&](const ValueDiff& value) {
        Json json;
        json[key] = value.key;
        json["change"] = diffKindText(diffKind(value.before.has_value(), value.after.has_value()));
        json["before"] = valueJson(value.before);
        json["after"] = valueJson(value.after);
        return json;
    });
}

Json levelsJson(const LevelsDiff& levels, const EditReport& before, const EditReport& after) {
    const auto nodeJson = [](const EditReport& report) {
        return [&](const Aud::DynamicLevelControl::Node& node) {
            return Json{
                {"time", report.frames(node.time)}, {"time_s", node.time}, {"level", levelJson(node.level)}};
        };
    };
    Json json;
    json["channel"] = levels.place;
    json["change"] = diffKindText(levels.kind);
    json["nodes_before"] = levels.nodesBefore;
    json["nodes_after"] = levels.nodesAfter;
    json["removed"] = listJson(levels.removed, nodeJson(before));
    json["added"] = listJson(levels.added, nodeJson(after));
    json["moved"] = movedJson(levels.moved, before);
    return json;
}

Json groupsJson(const GroupsDiff& groups) {
    const auto groupJson = [](const GroupContent& group) {
        return Json{{"type", group.type},
                    {"channels", listJson(group.channels, [](const String& place) { return Json(place); })}};
    };
    return {{"changed", groups.changed},
            {"before", groups.before},
            {"after", groups.after},
            {"removed", listJson(groups.removed, groupJson)},
            {"added", listJson(groups.added, groupJson)}};
}

} // namespace

String diffJson(const EditDiff& diff, const ContentDiff& content, const EditReport& before,
                const EditReport& after) {
    Json json;
    json["same"] = diff.same() && content.same();
    json["before"] = before.item.asString();
    json["after"] = after.item.asString();
    json["channels"] = listJson(
        diff.channels, [&](const ChannelDiff& channel) { return channelJson(channel, before, after); });
    const auto cueJson = [](const EditReport& report) {
        return [&report](const CueReport& cue) { return Json::parse(cueJsonText(report, cue)); };
    };
    json["cues"] = {{"changed", diff.cuesDiffer()},
                    {"before", diff.cuesBefore},
                    {"after", diff.cuesAfter},
                    {"removed", listJson(diff.cuesRemoved, cueJson(before))},
                    {"added", listJson(diff.cuesAdded, cueJson(after))},
                    {"moved", movedJson(diff.cuesMoved, before)}};
    json["levels"] =
        listJson(content.levels, [&](const LevelsDiff& levels) { return levelsJson(levels, before, after); });
    json["properties"] = listJson(content.properties, [](const PropertiesDiff& properties) {
        return Json{{"channel", properties.place}, {"values", valuesJson(properties.values, "property")}};
    });
    json["groups"] = groupsJson(content.groups);
    json["default_groups"] = groupsJson(content.defaultGroups);
    json["header"] = valuesJson(content.header, "key");
    json["objects"] = listJson(content.objects, [](const ObjectDiff& object) {
        return Json{{"object", object.name}, {"change", diffKindText(object.kind)}};
    });
    return json.dump(1, ' ', false, Json::error_handler_t::replace) + "\n";
}
