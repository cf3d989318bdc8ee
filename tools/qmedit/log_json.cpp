#include "tools/qmedit/log_json.h"

#include <nlohmann/json.hpp>

namespace {

using Json = nlohmann::ordered_json;

String logDumped(const Json& value) {
    return String(value.dump(-1, ' ', false, Json::error_handler_t::replace));
}

/// An array, an element a line.
template <class Range, class ToJson>
String lines(const Range& range, const ToJson& toJson) {
    String out = "[";
    for (const auto& element : range) {
        out += (out.size() == 1 ? "\n  " : ",\n  ") + logDumped(toJson(element));
    }
    return out + (out.size() == 1 ? "]\n" : "\n]\n");
}

Json texts(const std::vector<String>& from) {
    Json array = Json::array();
    for (const String& text : from) {
        array.push_back(static_cast<const std::string&>(text));
    }
    return array;
}

Json textOrNull(const String& text) {
    return text.empty() ? Json() : Json(static_cast<const std::string&>(text));
}

} // namespace

String attributesJson(const LogAttributes::Map& attributes) {
    Json json = Json::object();
    for (const auto& [attribute, text] : attributes) {
        json[LogAttributes::getPersistableString(attribute)] = static_cast<const std::string&>(text);
    }
    return logDumped(json) + "\n";
}

String foundJson(const std::vector<FoundEdit>& found) {
    return lines(found, [](const FoundEdit& edit) {
        Json json;
        json["cookie"] = edit.item.asString();
        for (int i = 0; i < projdb::kNumColumns; ++i) {
            const auto column = static_cast<projdb::Column>(i);
            if (column != projdb::FileSize && column != projdb::FileTime && !edit.record[column].empty()) {
                json[projdb::columnName(column)] = static_cast<const std::string&>(edit.record[column]);
            }
        }
        return json;
    });
}

const char* outcomeText(UpgradedEdit::Outcome outcome) {
    switch (outcome) {
    case UpgradedEdit::Current:
        return "current";
    case UpgradedEdit::WouldUpgrade:
        return "would upgrade";
    case UpgradedEdit::Upgraded:
        return "upgraded";
    case UpgradedEdit::NotWhole:
        return "not whole";
    case UpgradedEdit::Failed:
        break;
    }
    return "failed";
}

String upgradesJson(const std::vector<UpgradedEdit>& edits) {
    return lines(edits, [](const UpgradedEdit& edit) {
        const bool isKnown = edit.outcome != UpgradedEdit::Current && edit.upgrade.from > 0;
        Json json;
        json["cookie"] = edit.item.asString();
        json["outcome"] = outcomeText(edit.outcome);
        json["from"] = isKnown ? Json(edit.upgrade.from) : Json();
        json["to"] = isKnown ? Json(edit.upgrade.to) : Json();
        json["done"] = texts(edit.upgrade.done);
        json["not_done"] = texts(edit.upgrade.notDone);
        json["backup"] = textOrNull(edit.kept);
        json["error"] = textOrNull(edit.status.reason());
        return json;
    });
}
