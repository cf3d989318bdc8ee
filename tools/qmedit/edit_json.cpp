#include "tools/qmedit/edit_json.h"

#include "interchange/marker_colour.h"
#include "platform/services/clock.h"

#include <cmath>
#include <nlohmann/json.hpp>

namespace {

using Json = nlohmann::ordered_json;

String dumped(const Json& value) {
    return value.dump(-1, ' ', false, Json::error_handler_t::replace);
}

/// A text, or null for one that is not known.
Json textOrNull(const String& text, bool known) {
    return known ? Json(static_cast<const std::string&>(text)) : Json();
}

/// The rate as a number: 25 where it is whole, else the digits that people write (29.97).
Json rateNumber(Qx::FrameRate rate) {
    if (!rate.valid()) {
        return {};
    }
    if (rate.denominator() == 1) {
        return rate.numerator();
    }
    double value = 0;
    return Qx::textToDouble(rate.asString(), value) ? Json(value) : Json();
}

/// Frames and seconds of one time under a key and the key with "_s".
void addTime(Json& to, const char* key, const EditReport& report, double seconds) {
    to[key] = report.frames(seconds);
    to[std::string(key) + "_s"] = std::isfinite(seconds) ? Json(seconds) : Json();
}

Json pairJson(const EditReport& report, const PairReport& pair) {
    const SourceReport& source = report.sources[pair.source];
    Json json;
    json["in"] = report.frames(pair.in);
    json["out"] = report.frames(pair.out);
    json["strip_in"] = report.frames(pair.stripIn);
    json["strip_out"] = report.frames(pair.stripOut);
    json["in_s"] = pair.in;
    json["out_s"] = pair.out;
    json["strip_in_s"] = pair.stripIn;
    json["strip_out_s"] = pair.stripOut;
    json["strip"] = source.strip.asString();
    json["name"] = textOrNull(source.name, source.problem.empty() && !source.name.empty());
    json["kind"] = sourceKindText(source.kind);
    json["missing"] = !source.problem.empty();
    json["speed"] = pair.velocity;
    json["fade_in"] = report.frames(pair.fadeIn);
    json["fade_out"] = report.frames(pair.fadeOut);
    json["transition"] = transitionText(pair);
    json["effect"] = textOrNull(pair.effect, !pair.effect.empty());
    json["reel"] = textOrNull(source.reel, !source.reel.empty());
    json["event"] = textOrNull(pair.event, !pair.event.empty());
    return json;
}

/// Writes a list, an element a line.
template <class Range, class ToJson>
void addLines(String& out, const char* indent, const Range& range, const ToJson& toJson) {
    bool first = true;
    for (const auto& element : range) {
        out += first ? "\n" : ",\n";
        out += String(indent) + toJson(element);
        first = false;
    }
    if (!first) {
        out += String("\n") + String(indent).substr(2);
    }
}

/// The fields of `object` without its braces.
String fields(const Json& object) {
    const String text = dumped(object);
    return text.substr(1, text.size() - 2);
}

/// "ALIAS": the subtype's name without the label that files write before it.
std::string subtypeName(Edit_Chan_SubType subtype) {
    const std::string_view text = Edit::subTypeText(subtype);
    const size_t colon = text.find(':');
    return std::string(colon == std::string_view::npos ? text : text.substr(colon + 1));
}

String channelJson(const EditReport& report, const ChannelReport& channel) {
    Json head;
    head["id"] = channel.id.asString();
    head["name"] = channel.name;
    head["type"] = std::string(1, channel.letter());
    head["subtype"] = subtypeName(channel.subtype);
    String out = "{" + fields(head) + ",\"pairs\":[";
    addLines(out, "      ", channel.pairs,
             [&](const PairReport& pair) { return dumped(pairJson(report, pair)); });
    return out + "]}";
}

Json cueJson(const EditReport& report, const CueReport& cue) {
    Json json;
    addTime(json, "time", report, cue.time);
    addTime(json, "length", report, cue.length);
    json["text"] = cue.text;
    json["code"] = cue.code;
    const std::string_view colour = interchange::markerColourName(cue.code);
    json["colour"] = colour.empty() ? Json() : Json(std::string(colour));
    const bool hasChannel = cue.channel >= 0 && static_cast<size_t>(cue.channel) < report.channels.size();
    json["channel"] =
        hasChannel ? Json(report.channels[static_cast<size_t>(cue.channel)].id.asString()) : Json();
    json["attached"] = cue.attached;
    return json;
}

Json groupJson(const GroupReport& group) {
    Json json;
    json["type"] = group.type;
    json["channels"] = Json::array();
    for (const IdStamp& id : group.channels) {
        json["channels"].push_back(id.asString());
    }
    return json;
}

Json headerValue(const configb::Value& value) {
    return std::visit(
        [](const auto& content) -> Json {
            using Type = std::decay_t<decltype(content)>;
            if constexpr (std::is_same_v<Type, cookie>) {
                return content.asString();
            } else if constexpr (std::is_same_v<Type, double>) {
                return std::isfinite(content) ? Json(content) : Json();
            } else {
                return content;
            }
        },
        value);
}

String listedJson(const ListedEdit& edit) {
    Json json;
    json["cookie"] = edit.item.asString();
    const bool good = edit.damage.empty();
    json["type"] = textOrNull(edit.type, good);
    json["name"] = textOrNull(edit.name, good);
    json["rate"] = good ? rateNumber(edit.rate) : Json();
    json["rate_text"] = textOrNull(edit.rate.asString(), good);
    json["duration"] = good ? Json(edit.rate.toFrames(edit.duration)) : Json();
    json["duration_s"] = good ? Json(edit.duration) : Json();
    json["channels"] = good ? Json(edit.channels) : Json();
    json["modified"] = textOrNull(isoTime(edit.modified), good && edit.modified > 0);
    json["damaged"] = textOrNull(edit.damage, !good);
    return dumped(json);
}

} // namespace

String editJson(const EditReport& report) {
    Json head;
    head["cookie"] = report.item.asString();
    head["name"] = report.name;
    head["type"] = Edit::log_type_string_get_ms(report.type);
    head["rate"] = rateNumber(report.rate);
    head["rate_text"] = report.rate.asString();
    head["drop_frame"] = report.dropFrame;
    addTime(head, "start", report, report.origin + report.start);
    addTime(head, "origin", report, report.origin);
    addTime(head, "duration", report, report.duration());
    head["start_timecode"] = report.recordTimecode(report.start);
    head["modified"] = textOrNull(isoTime(report.modified), report.modified > 0);

    String out = "{";
    for (const auto& [key, value] : head.items()) {
        out += "\n  " + dumped(key) + ": " + dumped(value) + ",";
    }
    out += "\n  \"channels\": [";
    addLines(out, "    ", report.channels,
             [&](const ChannelReport& channel) { return channelJson(report, channel); });
    out += "],\n  \"cues\": [";
    addLines(out, "    ", report.cues, [&](const CueReport& cue) { return dumped(cueJson(report, cue)); });
    out += "],\n  \"groups\": [";
    addLines(out, "    ", report.groups, [](const GroupReport& group) { return dumped(groupJson(group)); });
    return out + "]\n}\n";
}

String listJson(const std::vector<ListedEdit>& edits) {
    String out = "[";
    addLines(out, "  ", edits, listedJson);
    return out + "]\n";
}

String markersJson(const EditReport& report) {
    String out = "[";
    int number = 0;
    addLines(out, "  ", report.cues, [&](const CueReport& cue) {
        Json json;
        json["number"] = ++number;
        json.update(cueJson(report, cue));
        return dumped(json);
    });
    return out + "]\n";
}

String pairJsonText(const EditReport& report, const PairReport& pair) {
    return dumped(pairJson(report, pair));
}

String cueJsonText(const EditReport& report, const CueReport& cue) {
    return dumped(cueJson(report, cue));
}

String valueJsonText(const configb::Value& value) {
    return dumped(headerValue(value));
}

String headerJson(const configb& header, const std::vector<String>& keys) {
    Json json = Json::object();
    for (const String& key : keys) {
        if (const configb::Value* value = header.find(key); value != nullptr) {
            json[key] = headerValue(*value);
        }
    }
    return String(json.dump(2, ' ', false, Json::error_handler_t::replace)) + "\n";
}

String reportJson(const std::vector<std::pair<const char*, String>>& texts,
                  const std::vector<std::pair<const char*, size_t>>& numbers,
                  const interchange::LossReport& report) {
    Json json;
    for (const auto& [key, text] : texts) {
        json[key] = textOrNull(text, !text.empty());
    }
    for (const auto& [key, number] : numbers) {
        json[key] = number;
    }
    const auto add = [&json](const char* key, const std::vector<interchange::Loss>& all) {
        json[key] = Json::array();
        for (const interchange::Loss& loss : all) {
            Json one;
            one["line"] = loss.line > 0 ? Json(loss.line) : Json();
            one["what"] = loss.what;
            json[key].push_back(std::move(one));
        }
    };
    add("errors", report.errors());
    add("losses", report.losses());
    add("warnings", report.warnings());
    add("notes", report.notes());
    return dumped(json);
}

String isoTime(int64_t seconds) {
    return Qx::isoTimeText(seconds);
}

String verifyJson(const std::vector<VerifiedFile>& files) {
    String out = "[";
    addLines(out, "  ", files, [](const VerifiedFile& file) {
        Json json;
        json["file"] = file.name;
        json["sound"] = file.faults.empty();
        json["faults"] = Json::array();
        for (const String& fault : file.faults) {
            json["faults"].push_back(std::string(fault));
        }
        return dumped(json);
    });
    return out + "]\n";
}

String historyJson(const cookie& item, const std::vector<Revision>& revisions) {
    String out = "{\n  \"cookie\": " + dumped(item.asString()) + ",\n  \"revisions\": [";
    addLines(out, "    ", revisions, [](const Revision& revision) {
        Json json;
        const bool sound = revision.isSound();
        json["which"] = revision.which;
        json["file"] = revision.path;
        json["name"] = textOrNull(revision.name, sound);
        json["changed"] = textOrNull(isoTime(revision.time), revision.time > 0);
        json["size"] = revision.file.size;
        json["modifications"] = sound ? Json(revision.modifications) : Json();
        json["change"] = textOrNull(revision.change, sound && !revision.change.empty());
        json["damaged"] = textOrNull(revision.damage, !sound);
        return dumped(json);
    });
    return out + "]\n}\n";
}

String salvageJson(const cookie& item, const Edit& edit, const std::vector<String>& lost) {
    Json json;
    json["cookie"] = item.asString();
    json["name"] = edit.getName();
    json["channels"] = edit.getNumChans();
    json["lost"] = Json::array();
    for (const String& line : lost) {
        json["lost"].push_back(std::string(line));
    }
    return dumped(json) + "\n";
}
