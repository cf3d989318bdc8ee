#include "edit/inspect/content_diff.h"

#include "edit/inspect/detail/row_diff.h"
#include "edit/model/edit_keys.h"
#include "platform/base/num_range.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <cstdint>
#include <map>
#include <set>
#include <string_view>

namespace {

using Aud::DynamicLevelControl::Node;

/// By bits, so that a value which is no number equals itself.
bool sameValue(const configb::Value& a, const configb::Value& b) {
    const auto* const x = std::get_if<double>(&a);
    const auto* const y = std::get_if<double>(&b);
    return x != nullptr && y != nullptr ? std::bit_cast<uint64_t>(*x) == std::bit_cast<uint64_t>(*y) : a == b;
}

std::optional<configb::Value> valueOf(const configb& values, const String& key) {
    const configb::Value* const value = values.find(key);
    return value != nullptr ? std::optional(*value) : std::nullopt;
}

std::vector<ValueDiff> valuesDiff(const configb& before, const configb& after) {
    std::vector<ValueDiff> diffs;
    for (const String& key : before.keys()) {
        const configb::Value* const now = after.find(key);
        if (!EditKeys::isBookkeeping(key) && (now == nullptr || !sameValue(*before.find(key), *now))) {
            diffs.push_back({key, valueOf(before, key), valueOf(after, key)});
        }
    }
    for (const String& key : after.keys()) {
        if (!EditKeys::isBookkeeping(key) && !before.contains(key)) {
            diffs.push_back({key, std::nullopt, valueOf(after, key)});
        }
    }
    return diffs;
}

/// Hands each thing of the two, with what corresponds to it by `nameOf` or null, to `compare`: those of the
/// second in their order, then those that only the first has.
template <class Content, class NameOf, class Compare>
void forEachPair(const std::vector<Content>& before, const std::vector<Content>& after, const NameOf& nameOf,
                 const Compare& compare) {
    std::map<std::string_view, const Content*> old;
    for (const Content& content : before) {
        old.emplace(nameOf(content), &content);
    }
    for (const Content& content : after) {
        const auto was = old.find(nameOf(content));
        compare(was != old.end() ? was->second : nullptr, &content);
        if (was != old.end()) {
            old.erase(was);
        }
    }
    for (const Content& content : before) {
        if (old.count(nameOf(content)) != 0) {
            compare(&content, nullptr);
        }
    }
}

constexpr auto kPlaceOf = [](const auto& content) { return std::string_view(content.place); };

std::vector<PropertiesDiff> propertiesDiff(const EditContent& before, const EditContent& after) {
    std::vector<PropertiesDiff> diffs;
    const configb none;
    const auto compare = [&](const ChannelContent* was, const ChannelContent* now) {
        std::vector<ValueDiff> values =
            valuesDiff(was != nullptr ? was->properties : none, now != nullptr ? now->properties : none);
        if (!values.empty()) {
            diffs.push_back({now != nullptr ? now->place : was->place, std::move(values)});
        }
    };
    forEachPair(before.channels, after.channels, kPlaceOf, compare);
    return diffs;
}

/// How the nodes of two levels are compared (see `RowComparison`). A level comes again and again: a node is
/// known by how far it is from the one before it as well.
struct NodeRules {
    const std::vector<Node>& was;
    const std::vector<Node>& now;

    [[nodiscard]] static double begin(const Node& node) { return node.time; }
    [[nodiscard]] static double end(const Node& node) { return node.time; }
    [[nodiscard]] bool same(size_t i, size_t j) const {
        return std::abs(was[i].time - now[j].time) <= Qx::kTimeTolerance && alike(i, j);
    }
    [[nodiscard]] bool alike(size_t i, size_t j) const { return was[i].level == now[j].level; }
    [[nodiscard]] size_t hash(WhichRow row, size_t i) const {
        const std::vector<Node>& nodes = row == WhichRow::Was ? was : now;
        const double pause = i > 0 ? nodes[i].time - nodes[i - 1].time : 0;
        return mixedHash(std::hash<float>()(nodes[i].level), timeHash(pause));
    }
    [[nodiscard]] static bool isAnchor(WhichRow, size_t) { return true; }
};

std::vector<LevelsDiff> levelsDiff(const EditContent& before, const EditContent& after) {
    std::vector<LevelsDiff> diffs;
    const std::vector<Node> none;
    const auto compare = [&](const LevelsContent* was, const LevelsContent* now) {
        const std::vector<Node>& old = was != nullptr ? was->nodes : none;
        const std::vector<Node>& young = now != nullptr ? now->nodes : none;
        LevelsDiff found{now != nullptr ? now->place : was->place,
                         diffKind(was != nullptr, now != nullptr),
                         old.size(),
                         young.size(),
                         {},
                         {},
                         {}};
        RowDiff<Node> rows = rowDiffOf(old, young, NodeRules{old, young});
        found.removed = std::move(rows.removed);
        found.added = std::move(rows.added);
        found.moved = std::move(rows.moved);
        if (found.kind != DiffKind::Changed || !found.removed.empty() || !found.added.empty() ||
            !found.moved.empty()) {
            diffs.push_back(std::move(found));
        }
    };
    forEachPair(before.levels, after.levels, kPlaceOf, compare);
    return diffs;
}

/// What of `these` is not among `those`; of equal ones each counts.
std::vector<GroupContent> without(const std::vector<GroupContent>& these,
                                  const std::vector<GroupContent>& those) {
    std::multiset<GroupContent> left(those.begin(), those.end());
    std::vector<GroupContent> rest;
    for (const GroupContent& group : these) {
        if (const auto found = left.find(group); found != left.end()) {
            left.erase(found);
        } else {
            rest.push_back(group);
        }
    }
    return rest;
}

GroupsDiff groupsDiff(const std::vector<GroupContent>& before, const std::vector<GroupContent>& after) {
    return {before != after, before.size(), after.size(), without(before, after), without(after, before)};
}

std::vector<ObjectDiff> objectsDiff(const EditContent& before, const EditContent& after) {
    std::vector<ObjectDiff> diffs;
    const auto compare = [&](const ObjectContent* was, const ObjectContent* now) {
        if (was == nullptr || now == nullptr || !(*was == *now)) {
            diffs.push_back(
                {now != nullptr ? now->name : was->name, diffKind(was != nullptr, now != nullptr)});
        }
    };
    forEachPair(
        before.objects, after.objects,
        [](const ObjectContent& object) { return std::string_view(object.name); }, compare);
    return diffs;
}

} // namespace

bool ContentDiff::same() const {
    return header.empty() && properties.empty() && levels.empty() && !groups.changed &&
           !defaultGroups.changed && objects.empty();
}

ContentDiff contentDiffOf(const EditContent& before, const EditContent& after) {
    return {valuesDiff(before.header, after.header),
            propertiesDiff(before, after),
            levelsDiff(before, after),
            groupsDiff(before.groups, after.groups),
            groupsDiff(before.defaultGroups, after.defaultGroups),
            objectsDiff(before, after)};
}
