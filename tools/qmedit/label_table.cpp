#include "tools/qmedit/label_table.h"

#include "tools/qmedit/column_table.h"

#include "platform/media/timecode.h"

#include <memory>
#include <nlohmann/json.hpp>

namespace {

using Json = nlohmann::ordered_json;

String dumped(const Json& value) {
    return String(value.dump(-1, ' ', false, Json::error_handler_t::replace)) + "\n";
}

Json jsonText(const String& text) {
    return static_cast<const std::string&>(text);
}

/// One pair with the texts of its labels at its ends.
struct LabelledPair {
    String place;
    const SourceReport* source;
    double in;
    double out;
    std::vector<std::pair<String, String>> texts;
};

std::vector<LabelledPair> labelled(const EditReport& report, const std::vector<ShownLabel>& wanted,
                                   EventLabels& labels) {
    std::vector<LabelledPair> pairs;
    for (const ChannelReport& channel : report.channels) {
        for (const PairReport& pair : channel.pairs) {
            const SourceReport& source = report.sources[pair.source];
            LabelledPair& made =
                pairs.emplace_back(LabelledPair{channel.place, &source, pair.in, pair.out, {}});
            for (const ShownLabel& label : wanted) {
                made.texts.emplace_back(labels.textOf(label, source.strip, pair.stripIn, pair.in),
                                        labels.textOf(label, source.strip, pair.stripOut, pair.out));
            }
        }
    }
    return pairs;
}

String tableOf(const EditReport& report, const std::vector<ShownLabel>& wanted,
               const std::vector<LabelledPair>& pairs, const Console& console) {
    std::vector<String> heading{"track", "in", "out"};
    for (const ShownLabel& label : wanted) {
        heading.push_back(label.name);
        heading.emplace_back("to");
    }
    heading.emplace_back("source");
    const size_t columns = heading.size();
    const auto isRight = std::make_unique<bool[]>(columns);
    ColumnTable table(std::move(heading), {isRight.get(), columns});
    for (const LabelledPair& pair : pairs) {
        std::vector<String> row{pair.place, report.recordTimecode(pair.in), report.recordTimecode(pair.out)};
        for (const auto& [in, out] : pair.texts) {
            row.push_back(in.empty() ? "-" : console.safe(in));
            row.push_back(out.empty() ? "-" : console.safe(out));
        }
        row.push_back(pair.source->name.empty() ? String(sourceKindText(pair.source->kind))
                                                : console.safe(pair.source->name));
        table.add(std::move(row), Console::Ink::None);
    }
    return table.text(console, true);
}

String jsonOf(const EditReport& report, const std::vector<ShownLabel>& wanted,
              const std::vector<LabelledPair>& pairs) {
    Json array = Json::array();
    for (const LabelledPair& pair : pairs) {
        Json json;
        json["track"] = jsonText(pair.place);
        json["in"] = report.frames(pair.in);
        json["out"] = report.frames(pair.out);
        json["strip"] = jsonText(pair.source->strip.asString());
        for (size_t i = 0; i < wanted.size(); ++i) {
            json["labels"][wanted[i].name] = {jsonText(pair.texts[i].first), jsonText(pair.texts[i].second)};
        }
        array.push_back(std::move(json));
    }
    return dumped(array);
}

/// The edit time of a record timecode. False, with a report, for a text that is none.
bool timeOf(const EditReport& report, const std::string& text, double& time) {
    int64_t frames = 0;
    if (const Qx::Status read = Qx::parseDuration(text, report.rate, report.dropFrame, frames); !read) {
        reportError("'" + text + "' is no timecode: " + read.reason());
        return false;
    }
    time = report.rate.toSeconds(frames) - report.origin;
    return true;
}

String burnInText(const EditReport& report, double time, bool asJson, EventLabels& labels) {
    const auto shown = labels.burnIn(time);
    if (asJson) {
        Json json;
        json["time"] = report.frames(time);
        for (const auto& [name, text] : shown) {
            json["labels"][name] = jsonText(text);
        }
        return dumped(json);
    }
    const Console console = Console::forStandardOutput();
    constexpr bool rightAligned[] = {false, false};
    ColumnTable table({"label", "at " + report.recordTimecode(time)}, rightAligned);
    for (const auto& [name, text] : shown) {
        table.add({name, console.safe(text)}, Console::Ink::None);
    }
    return table.text(console, true);
}

} // namespace

int showLabels(const EditReport& report, const ShowOptions& options, EventLabels& labels) {
    if (!options.burnIn.empty()) {
        double time = 0;
        if (!timeOf(report, options.burnIn, time)) {
            return kWrongUsage;
        }
        writeOut(burnInText(report, time, options.json, labels));
        return kDone;
    }
    std::vector<ShownLabel> wanted;
    for (const std::string& name : options.labels) {
        if (!ShownLabel::fromText(name, wanted.emplace_back())) {
            reportError("'" + name +
                        "' is no label; there are Primary_Timecode, KeyKode, 24P_Timecode, Ink_code, "
                        "Foot/frame, reelid, scene and others");
            return kWrongUsage;
        }
    }
    const std::vector<LabelledPair> pairs = labelled(report, wanted, labels);
    writeOut(options.json ? jsonOf(report, wanted, pairs)
                          : tableOf(report, wanted, pairs, Console::forStandardOutput()));
    return kDone;
}
