#include "tools/qmedit/seen_text.h"

#include <nlohmann/json.hpp>

namespace {

using Seen = nlohmann::ordered_json;

Seen textOrNone(const String& text) {
    return text.empty() ? Seen() : Seen(static_cast<const std::string&>(text));
}

Seen nodeJson(const SeenNode& node) {
    Seen json;
    json["kind"] = seenKindText(node.kind);
    json["parent"] = node.parent < 0 ? Seen() : Seen(node.parent);
    json["input"] = node.input < 0 ? Seen() : Seen(node.input);
    json["share"] = node.share;
    json["name"] = textOrNone(node.name);
    json["edit"] = node.edit.asString();
    json["channel"] = textOrNone(node.place);
    json["time_s"] = node.time;
    json["timecode"] = textOrNone(node.timecode);
    const bool hasEvent = !node.place.empty();
    json["in_s"] = hasEvent ? Seen(node.in) : Seen();
    json["out_s"] = hasEvent ? Seen(node.out) : Seen();
    if (node.kind == SeenKind::Effect || node.kind == SeenKind::Transition) {
        json["opacity"] = node.opacity;
        json["progress"] = node.kind == SeenKind::Transition ? Seen(node.progress) : Seen();
    }
    if (node.kind == SeenKind::Source || node.kind == SeenKind::Nested) {
        json["source"] = node.source.strip.asString();
        json["source_time_s"] = node.sourceTime;
        json["source_timecode"] = textOrNone(node.sourceTimecode);
    }
    return json;
}

String dumpedSeen(const Seen& json) {
    return String(json.dump(-1, ' ', false, Seen::error_handler_t::replace));
}

} // namespace

String seenJson(const SeenReport& report) {
    String out = "[";
    for (const SeenNode& node : report.nodes) {
        out += (out.size() == 1 ? "\n  " : ",\n  ") + dumpedSeen(nodeJson(node));
    }
    return out + (report.nodes.empty() ? "]\n" : "\n]\n");
}

String seenDot(const SeenReport& report) {
    // A text in the language is quoted as one of JSON is.
    String out = "digraph seen {\n  node [shape=box];\n";
    for (size_t i = 0; i < report.nodes.size(); ++i) {
        const SeenNode& node = report.nodes[i];
        String label = node.name.empty() ? String(seenKindText(node.kind)) : node.name;
        label += node.place.empty() ? String() : "\n" + node.place + "  " + node.timecode;
        label += node.sourceTimecode.empty() ? String() : "\nplays " + node.sourceTimecode;
        out +=
            String::format("  n%zu [label=", i) + dumpedSeen(static_cast<const std::string&>(label)) + "];\n";
        if (node.parent >= 0) {
            out += String::format("  n%d -> n%zu [label=\"%.0f %%\"];\n", node.parent, i, node.share * 100);
        }
    }
    return out + "}\n";
}
