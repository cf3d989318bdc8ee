#include "tools/qmedit/edit_diff_text.h"

#include "edit/model/channel_group.h"
#include "tools/qmedit/console.h"
#include "tools/qmedit/safe_text.h"
#include "tools/qmedit/value_text.h"

#include <algorithm>
#include <cmath>

namespace {

using Aud::DynamicLevelControl::Node;

/// So many things of a kind are written; what is left out is counted.
constexpr size_t kMostLines = 12;
constexpr int kValueColumns = 60;
/// Where two texts are alike for more columns than this they are shown from shortly before they differ.
constexpr int kAlikeColumns = 40;
constexpr size_t kBytesBefore = 12;

/// Something told in one or more lines below a heading, for each of `things`.
template <class Things, class TextOf>
String firstOf(const Things& things, const TextOf& textOf) {
    String text;
    for (size_t i = 0; i < std::min(things.size(), kMostLines); ++i) {
        text += textOf(things[i]);
    }
    if (things.size() > kMostLines) {
        text += String::format("    %zu more\n", things.size() - kMostLines);
    }
    return text;
}

String line(char sign, const String& text) {
    return String("  ") + sign + " " + text + "\n";
}

/// Where to begin to show two texts so that what differs is seen.
size_t beginOf(const String& a, const String& b) {
    const auto differ = std::mismatch(a.begin(), a.end(), b.begin(), b.end()).first;
    const auto alike = static_cast<size_t>(differ - a.begin());
    if (alike <= kBytesBefore ||
        safe_text::columns(safe_text::escaped(std::string_view(a).substr(0, std::min<size_t>(alike, 100)))) <=
            kAlikeColumns) {
        return 0;
    }
    size_t begin = alike - kBytesBefore;
    // Not inside a character.
    for (int i = 0; i < 3 && (static_cast<unsigned char>(a[begin]) & 0xC0U) == 0x80U; ++i) {
        --begin;
    }
    return begin;
}

String shownValue(const configb::Value& value, size_t begin, const Console& console) {
    const auto* const text = std::get_if<String>(&value);
    String shown = begin > 0 ? String(console.ellipsis()) : String();
    // No more is escaped than can be shown.
    shown += text != nullptr ? console.safe(std::string_view(*text).substr(begin, 4 * kValueColumns))
                             : valueText(value, console);
    return safe_text::fitted(shown, kValueColumns, console.ellipsis());
}

String valueLines(const ValueDiff& diff, const char* unit, const Console& console) {
    static constexpr const char* kTypes[] = {"int", "int64", "double", "string", "cookie", "bool"};
    static_assert(std::size(kTypes) == std::variant_size_v<configb::Value>);
    const bool both = diff.before.has_value() && diff.after.has_value();
    const auto* const was = both ? std::get_if<String>(&*diff.before) : nullptr;
    const auto* const now = both ? std::get_if<String>(&*diff.after) : nullptr;
    const size_t begin = was != nullptr && now != nullptr ? beginOf(*was, *now) : 0;
    const bool otherType = both && diff.before->index() != diff.after->index();
    const String key = safe_text::fitted(console.safe(diff.key), kValueColumns, console.ellipsis());
    String text;
    for (const auto& [sign, value] : {std::pair('-', &diff.before), std::pair('+', &diff.after)}) {
        if (value->has_value()) {
            const String type = otherType ? String(" (") + kTypes[(*value)->index()] + ")" : String();
            text += line(sign, key + "  " + shownValue(**value, begin, console) + unit + type);
        }
    }
    return text;
}

String headerText(const std::vector<ValueDiff>& header, const Console& console) {
    if (header.empty()) {
        return {};
    }
    return String::format("header  changed; %zu key%s\n", header.size(), header.size() == 1 ? "" : "s") +
           firstOf(header, [&](const ValueDiff& value) { return valueLines(value, "", console); });
}

/// A property is told as people write it: "sync_loss_s" is "sync loss" in seconds.
String propertyLines(ValueDiff property, const Console& console) {
    const bool isTime = property.key.ends_with("_s");
    property.key.resize(property.key.size() - (isTime ? 2 : 0));
    std::replace(property.key.begin(), property.key.end(), '_', ' ');
    return valueLines(property, isTime ? " s" : "", console);
}

String nodeText(char sign, const Node& node, const EditReport& report) {
    String text = report.recordTimecode(node.time);
    // Nodes lie between frames, too.
    if (std::abs(report.rate.toSeconds(report.frames(node.time)) - node.time) > 1e-6) {
        text += " (" + Qx::doubleToText(node.time) + " s)";
    }
    return line(sign, text + "  level " + levelText(node.level));
}

String levelsText(const LevelsDiff& levels, const EditReport& before, const EditReport& after) {
    return levels.place + "  " + diffKindText(levels.kind) +
           String::format("; nodes: %zu before, %zu after\n", levels.nodesBefore, levels.nodesAfter) +
           firstOf(levels.removed, [&](const Node& node) { return nodeText('-', node, before); }) +
           firstOf(levels.added, [&](const Node& node) { return nodeText('+', node, after); }) +
           firstOf(levels.moved,
                   [&](const MovedRun<Node>& run) { return line('>', movedText(run, "node", before)); });
}

String groupText(const GroupContent& group) {
    String text;
    for (const String& channel : group.channels) {
        text += (text.empty() ? "" : " ") + channel;
    }
    switch (group.type) {
    case ChannelGroup::ePlain:
        return text;
    case ChannelGroup::eStereo:
        return text + "  stereo";
    case ChannelGroup::eStereoscopic:
        return text + "  stereoscopic";
    case ChannelGroup::eSurround:
        return text + "  surround";
    default:
        return text + "  of type " + std::to_string(group.type);
    }
}

String groupsText(const char* heading, const GroupsDiff& groups) {
    if (!groups.changed) {
        return {};
    }
    const bool onlyOrder = groups.removed.empty() && groups.added.empty();
    return String(heading) +
           (onlyOrder ? String("  changed  only in their order\n")
                      : String::format("  changed; %zu before, %zu after\n", groups.before, groups.after)) +
           firstOf(groups.removed, [](const GroupContent& group) { return line('-', groupText(group)); }) +
           firstOf(groups.added, [](const GroupContent& group) { return line('+', groupText(group)); });
}

} // namespace

String contentDiffText(const ContentDiff& diff, const EditReport& before, const EditReport& after,
                       const Console& console) {
    String text;
    for (const LevelsDiff& levels : diff.levels) {
        text += levelsText(levels, before, after);
    }
    for (const PropertiesDiff& properties : diff.properties) {
        text += properties.place + "  properties changed\n" +
                firstOf(properties.values,
                        [&](const ValueDiff& property) { return propertyLines(property, console); });
    }
    text += groupsText("groups", diff.groups);
    text += groupsText("default groups", diff.defaultGroups);
    text += headerText(diff.header, console);
    return text + firstOf(diff.objects, [&](const ObjectDiff& object) {
               return "object " + console.safe(object.name) + "  " + diffKindText(object.kind) + "\n";
           });
}
