#include "tools/qmedit/channel_choice.h"

#include "edit/model/edit.h"

#include <algorithm>

namespace {

constexpr size_t kMostDigits = 4;

/// "V1-V2, A1-A4": the channels of an edit by kind and number.
String channelsText(const Edit& edit) {
    String text;
    for (const auto& [letter, type] : {std::pair('V', VideoChan), std::pair('A', AudioChan)}) {
        const int count = edit.getNumChans(type, Edit_Chan_SubType::NONE);
        if (count > 0) {
            text += (text.empty() ? "" : ", ") + String(1, letter) + "1" +
                    (count > 1 ? String::format("-%c%d", letter, count) : String());
        }
    }
    return text.empty() ? String("no channel") : text;
}

} // namespace

Qx::Status ChannelChoice::parse(const String& text, ChannelChoice& choice) {
    std::vector<Name> names;
    for (size_t at = 0; at < text.size();) {
        const String letter = String(text.substr(at, 1)).upper();
        const size_t end = std::min(text.find_first_not_of("0123456789", at + 1), text.size());
        const String digits = text.substr(at + 1, end - at - 1);
        int number = 0;
        if ((letter != "V" && letter != "A") || digits.size() > kMostDigits ||
            (!digits.empty() && (!Qx::textToInt(digits, number) || number == 0))) {
            return Qx::Status::failure(Qx::StatusCode::BadArgument,
                                       "'" + text +
                                           "' names no channel; write V for the picture and A with a "
                                           "number for a sound channel, as in VA1A2");
        }
        names.push_back({letter == "V" ? VideoChan : AudioChan, number, letter + digits});
        at = end;
    }
    choice.m_names = std::move(names);
    return {};
}

int ChannelChoice::highest(Edit_Chan_Type type) const {
    int number = 0;
    for (const Name& name : m_names) {
        number = name.type == type ? std::max({number, name.number, 1}) : number;
    }
    return number;
}

void ChannelChoice::find(const Edit& edit, const Name& name, Vector<IdStamp>& chans) {
    if (name.number == 0) {
        edit.getChans(chans, name.type);
        return;
    }
    Vector<IdStamp> ofKind;
    edit.getChans(ofKind, name.type, Edit_Chan_SubType::NONE);
    if (const auto place = static_cast<size_t>(name.number) - 1; place < ofKind.size()) {
        chans.push_back(ofKind[place]);
    }
}

void ChannelChoice::select(EditModule& module) const {
    const Edit& edit = *module.getEdit();
    Vector<IdStamp> all;
    Vector<IdStamp> named;
    edit.getChans(all);
    for (const Name& name : m_names) {
        find(edit, name, named);
    }
    for (const IdStamp& chan : all) {
        if (edit.getChanType(chan) == VideoChan || edit.getChanType(chan) == AudioChan) {
            module.selectChan(chan, std::find(named.begin(), named.end(), chan) != named.end());
        }
    }
}

Qx::Status ChannelChoice::check(const std::vector<EditPtr>& edits) const {
    for (const Name& name : m_names) {
        Vector<IdStamp> chans;
        String have;
        for (const EditPtr& edit : edits) {
            if (edit.valid()) {
                find(*edit, name, chans);
                have += (have.empty() ? "" : "; ") + edit->get_cookie().asString() + " has " +
                        channelsText(*edit);
            }
        }
        if (chans.empty()) {
            return Qx::Status::failure(Qx::StatusCode::NotFound, "there is no " + name.text + ": " + have);
        }
    }
    return {};
}
