#include "interchange/edl/detail/edl_sources.h"

#include "edit/model/edit_keys.h"
#include "interchange/edl/detail/edl_line.h"
#include "interchange/edl/edl_records.h"

#include <algorithm>

namespace interchange::detail {

namespace {

constexpr size_t kReelSize = 8;
constexpr const char* kBlackReel = "BL";

bool isReelCharacter(char c) {
    return (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9');
}

bool isStrictReel(std::string_view reel) {
    return !reel.empty() && reel.size() <= kReelSize && reel != kBlackReel && reel != "BLACK" &&
           std::all_of(reel.begin(), reel.end(), isReelCharacter);
}

String shortened(std::string_view full) {
    String reel;
    for (const char c : String(full).upper()) {
        if (isReelCharacter(c) && reel.size() < kReelSize) {
            reel += c;
        }
    }
    return reel.empty() ? String("REEL") : reel;
}

// The first of the reel itself, then the reel ending with 2, 3 and on, that is not taken.
String uniqueReel(const String& wanted, const std::unordered_set<std::string>& taken) {
    String reel = wanted;
    for (unsigned number = 2; !isStrictReel(reel) || reel == "AX" || taken.contains(reel); ++number) {
        const String suffix = std::to_string(number);
        reel = wanted.substr(0, kReelSize - suffix.size()) + suffix;
    }
    return reel;
}

} // namespace

String oneLine(std::string_view text) {
    bool replaced = false;
    String line = utf8Name(text, replaced);
    for (char& c : line) {
        const auto byte = static_cast<unsigned char>(c);
        c = byte < 0x20 || byte == 0x7F ? ' ' : c;
    }
    return String(trimBlanks(line));
}

EdlSources::EdlSources(const Edit& edit, Qx::FrameRate rate, const EdlExportOptions& options,
                       LossReport& report)
    : m_edit(edit), m_rate(rate), m_options(options), m_report(report) {}

size_t EdlSources::find(const cookie& strip) {
    const auto [place, added] = m_byStrip.try_emplace(strip, m_sources.size());
    if (added) {
        EdlSource& source = m_sources.emplace_back();
        source.strip = strip;
        source.black = strip.isBlack();
        if (source.black) {
            source.reel = source.fullReel = kBlackReel;
        } else {
            describe(source);
        }
    }
    return place->second;
}

void EdlSources::describe(EdlSource& source) {
    const cookie& strip = source.strip;
    const bool isMedia = strip.type() == Cookie_Type::Video || strip.type() == Cookie_Type::Sound;
    const cookie& own = m_edit.get_cookie();
    if (isMedia && strip.word(0) == own.word(0) && strip.word(1) == own.word(1)) {
        takeHeader(source, m_edit); // a shot plays its own media
        return;
    }
    EditPtr shot;
    if (m_options.source) {
        shot = m_options.source(strip);
    } else if (strip.isStorable()) {
        EditPtr read(new Edit);
        if (read->read_file(strip, eOpenExisting) == Edit::kReadOk) {
            shot = read;
        }
    }
    if (!shot.valid()) {
        source.fullReel = strip.asString();
        m_report.addWarning(0, "source " + strip.asString() +
                                   " cannot be read, so that its reel and name are not known");
        return;
    }
    takeHeader(source, *shot);
    if (shot->get_log_type() == kLogEdit) {
        m_report.addLoss(0, "source " + strip.asString() +
                                " is an edit of its own; the list names it as one source");
    }
    if (shot->getFrameRate() != m_rate) {
        m_report.addLoss(0, "source " + strip.asString() + " runs at " + shot->getFrameRate().asString() +
                                " frames a second; its times are written at the list's " + m_rate.asString());
    }
}

void EdlSources::takeHeader(EdlSource& source, const Edit& shot) {
    const configb& header = shot.Opts();
    source.drop = EditKeys::kDropFrame.get(header) && m_rate.hasDropFrame();
    source.name = oneLine(shot.getName());
    source.sourceFile = oneLine(header.getString(EdlKey::kSourceFile));
    source.mediaPath = oneLine(header.getString(EdlKey::kMediaPath));
    source.fullReel = oneLine(header.getString(EdlKey::kReel));
    if (source.fullReel.empty()) {
        source.fullReel = source.name.empty() ? source.strip.asString() : source.name;
    }
}

void EdlSources::nameReels(const std::unordered_set<std::string>& kept) {
    std::unordered_map<std::string, String> reels; // full name to reel
    std::unordered_set<std::string> taken;
    for (const EdlSource& source : m_sources) {
        const String& full = source.fullReel;
        if (!source.black && (isStrictReel(full) || kept.contains(full))) {
            reels.emplace(full, full);
            taken.insert(full);
        }
    }
    for (EdlSource& source : m_sources) {
        if (source.black) {
            continue;
        }
        const auto [place, added] = reels.try_emplace(source.fullReel);
        if (added) {
            place->second = uniqueReel(shortened(source.fullReel), taken);
            taken.insert(place->second);
        }
        source.reel = place->second;
        if (source.reel != source.fullReel && source.sourceFile.empty()) {
            source.sourceFile = source.fullReel;
        }
        const String& known = source.sourceFile.empty() ? source.reel : source.sourceFile;
        if (source.name == known) {
            source.name.clear();
        }
    }
    checkAlike();
}

void EdlSources::checkAlike() {
    std::unordered_map<std::string, const EdlSource*> known;
    for (const EdlSource& source : m_sources) {
        const bool nameless = source.name.empty() && source.sourceFile.empty();
        if (source.black || (nameless && source.reel == "AX")) {
            continue;
        }
        const auto [place, added] =
            known.emplace(source.reel + "\n" + source.name + "\n" + source.sourceFile, &source);
        if (!added) {
            m_report.addLoss(0, "sources " + place->second->strip.asString() + " and " +
                                    source.strip.asString() +
                                    " have one reel and one name; the list cannot tell them apart");
        }
    }
}

} // namespace interchange::detail
