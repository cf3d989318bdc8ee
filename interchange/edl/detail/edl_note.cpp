#include "interchange/edl/detail/edl_note.h"

#include "interchange/edl/detail/edl_line.h"

namespace interchange::detail {

namespace {

struct Keyword {
    std::string_view text;
    NoteKind kind;
    bool neverStarred; ///< with a star in front it is a comment
};

// Longer keywords before their beginnings.
constexpr Keyword kKeywords[] = {
    {"FROM CLIP NAME", NoteKind::FromClipName, false},
    {"FROM CLIP IS A STILL", NoteKind::Other, false},
    {"FROM CLIP", NoteKind::MediaFrom, false},
    {"FROM FILE", NoteKind::MediaFrom, false},
    {"TO CLIP NAME", NoteKind::ToClipName, false},
    {"TO FILE", NoteKind::MediaTo, false},
    {"TO CLIP", NoteKind::MediaTo, false},
    {"KEY CLIP NAME", NoteKind::KeyClipName, false},
    {"SOURCE FILE", NoteKind::SourceFile, false},
    {"FINAL CUT PRO REEL", NoteKind::FullReel, false},
    {"LOC", NoteKind::Marker, false},
    {"EFFECT NAME", NoteKind::EffectName, false},
    {"EFFECTS NAME IS", NoteKind::EffectName, false},
    {"BLEND,", NoteKind::EffectName, false},
    {"FREEZE FRAME", NoteKind::FreezeFrame, false},
    {"AUD", NoteKind::Audio, true},
    {"M2", NoteKind::Speed, true},
    {"SPLIT", NoteKind::Split, true},
};

bool startsWithKeyword(std::string_view text, std::string_view keyword) {
    if (!text.starts_with(keyword)) {
        return false;
    }
    const std::string_view rest = text.substr(keyword.size());
    return rest.empty() || rest.front() == ' ' || rest.front() == '\t' || rest.front() == ':';
}

} // namespace

Note parseNote(std::string_view line) {
    std::string_view text = trimBlanks(line);
    bool starred = false;
    while (!text.empty() && text.front() == '*') {
        text = trimBlanks(text.substr(1));
        starred = true;
    }
    for (const Keyword& keyword : kKeywords) {
        if (startsWithKeyword(text, keyword.text) && !(keyword.neverStarred && starred)) {
            std::string_view value = trimBlanks(text.substr(keyword.text.size()));
            if (!value.empty() && value.front() == ':') {
                value = trimBlanks(value.substr(1));
            }
            return {keyword.kind, value};
        }
    }
    return {NoteKind::Other, text};
}

std::string_view takeWord(std::string_view& text) {
    text = trimBlanks(text);
    const size_t end = text.find_first_of(" \t");
    const std::string_view word = text.substr(0, end);
    text = end == std::string_view::npos ? std::string_view() : trimBlanks(text.substr(end));
    return word;
}

} // namespace interchange::detail
