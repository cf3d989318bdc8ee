#include "platform/media/label.h"

#include "platform/media/timecode.h"

namespace {

bool isDigit(char c) {
    return c >= '0' && c <= '9';
}

char upper(char c) {
    return c >= 'a' && c <= 'z' ? static_cast<char>(c - 'a' + 'A') : c;
}

bool isLetter(char c) {
    return upper(c) >= 'A' && upper(c) <= 'Z';
}

bool isBlank(char c) {
    return c == ' ' || c == '\t';
}

/// More digits than any part of a label has; a count with more is refused before it can overflow.
constexpr size_t kMostDigits = 9;

} // namespace

/// Reads one text from left to right. The first thing that is wrong is kept with its place.
struct label::Reader {
    explicit Reader(std::string_view whole) : text(whole) {
        while (!text.empty() && isBlank(text.back())) {
            text.remove_suffix(1);
        }
        skipBlanks();
    }

    [[nodiscard]] bool atEnd() const { return at == text.size(); }
    [[nodiscard]] char next() const { return atEnd() ? '\0' : text[at]; }
    void skipBlanks() {
        while (isBlank(next())) {
            ++at;
        }
    }
    bool skip(char c) {
        const bool there = next() == c && !atEnd();
        at += there ? 1 : 0;
        return there;
    }
    /// Digits from here on, at most `most`; how many there are.
    size_t digits(size_t most, int64_t& number) {
        const size_t first = at;
        number = 0;
        while (at - first < most && isDigit(next())) {
            number = number * 10 + (text[at++] - '0');
        }
        return at - first;
    }
    bool fail(String what) {
        if (reason.empty()) {
            reason = std::move(what);
            wrongAt = at;
        }
        return false;
    }
    bool end() { return atEnd() || fail("nothing more is expected"); }
    [[nodiscard]] Qx::Status status(const char* kind) const {
        if (reason.empty()) {
            return {};
        }
        String shown;
        for (const char c : text.substr(0, 40)) {
            shown += c >= ' ' && c <= '~' ? c : '?';
        }
        return Qx::Status::failure(String::format("\"%s%s\" is not a %s: %s, at character %zu", shown.c_str(),
                                                  text.size() > 40 ? "..." : "", kind, reason.c_str(),
                                                  wrongAt + 1));
    }

    bool timecode(label& read);
    bool keyNumber(label& read);
    bool feetAndFrames(label& read);
    bool inkNumber(label& read);
    bool frameOf(label& read, int64_t count);
    bool keyDigits(label& read);
    void inkPrefixLength(size_t& prefix, size_t& digits) const;

    std::string_view text;
    size_t at = 0;
    size_t wrongAt = 0;
    String reason;
};

bool label::Reader::timecode(label& read) {
    Qx::TimecodeFields fields;
    if (Qx::Status status = Qx::parseTimecode(text.substr(at), read.m_scale.rate, fields); !status) {
        return fail(status.reason());
    }
    if (fields.dropSeparator && !read.m_scale.dropFrame) {
        at = text.find_first_of(";,");
        return fail("the timecode counted with does not drop frames, so a ':' stands here");
    }
    bool skipped = false;
    read.m_frames = Qx::timecodeFrames(fields, read.m_scale.rate, read.m_scale.dropFrame, &skipped);
    if (skipped) {
        at = text.size() - 1;
        return fail("drop frame leaves this frame out");
    }
    return true;
}

/// "+12" behind a count.
bool label::Reader::frameOf(label& read, int64_t count) {
    if (!skip('+')) {
        return fail("a '+' and the frame are expected");
    }
    const Qx::FilmCount counted = read.count();
    int64_t frame = 0;
    const size_t first = at;
    if (digits(2, frame) == 0) {
        return fail("the frame's number is expected");
    }
    if (isDigit(next()) || frame >= counted.framesIn(count)) {
        at = first;
        return fail(String::format("the frame must be 00 to %d here", counted.framesIn(count) - 1));
    }
    read.m_frames = counted.firstFrameOf(count) + frame;
    return true;
}

/// The six digits of the prefix, blanks between them.
bool label::Reader::keyDigits(label& read) {
    for (size_t i = 2; i < 8; ++i) {
        skipBlanks();
        if (!isDigit(next())) {
            return fail("a prefix of two letters and six digits is expected");
        }
        read.m_prefix[i] = text[at++];
    }
    read.m_prefixLength = 8;
    return true;
}

bool label::Reader::keyNumber(label& read) {
    for (size_t i = 0; i < 2; ++i) {
        if (!isLetter(next())) {
            return fail("a prefix of two letters and six digits is expected");
        }
        read.m_prefix[i] = upper(text[at++]);
    }
    if (!keyDigits(read)) {
        return false;
    }
    if (!skip('-')) {
        skipBlanks();
    }
    int64_t number = 0;
    if (digits(4, number) != 4) {
        return fail("a count of four digits is expected");
    }
    const size_t frameAt = at;
    // The place in the turn of three stands last and decides how many frames the foot has.
    const size_t bracket = text.find('(', at);
    if (bracket != std::string_view::npos) {
        at = bracket + 1;
        int64_t place = 0;
        const bool isOne = read.m_scale.gauge == FilmGauge::Film35mm3Perf && digits(1, place) == 1 &&
                           place >= 1 && place <= 3 && skip(')');
        if (!isOne) {
            at = bracket;
            return fail("a foot's place is (1), (2) or (3), and only of 35mm 3-perf");
        }
        if (!end()) {
            return false;
        }
        text = text.substr(0, bracket);
        at = frameAt;
        read.m_pattern = static_cast<uint8_t>(((place - 1 - number) % 3 + 3) % 3);
        read.m_showsPlace = true;
    }
    if (!frameOf(read, number)) {
        return false;
    }
    if (skip('.')) {
        int64_t perforation = 0;
        if (digits(1, perforation) != 1 || perforation >= Qx::perforationsPerFrame(read.m_scale.gauge)) {
            return fail(String::format("a perforation 0 to %d is expected",
                                       Qx::perforationsPerFrame(read.m_scale.gauge) - 1));
        }
        read.m_perforations = static_cast<uint8_t>(perforation);
        read.m_showsPerforations = true;
    }
    return end();
}

bool label::Reader::feetAndFrames(label& read) {
    const bool negative = skip('-');
    int64_t feet = 0;
    if (digits(kMostDigits, feet) == 0) {
        return fail("feet are expected");
    }
    if (isDigit(next())) {
        return fail("these are more feet than any roll has");
    }
    if (!frameOf(read, feet) || !end()) {
        return false;
    }
    read.m_frames = negative ? -read.m_frames : read.m_frames;
    return true;
}

/// Tells the prefix from the feet in the letters and digits that stand here without a blank.
void label::Reader::inkPrefixLength(size_t& prefix, size_t& figures) const {
    size_t end = at;
    size_t afterLetter = at;
    while (end < text.size() && (isLetter(text[end]) || isDigit(text[end]))) {
        if (isLetter(text[end++])) {
            afterLetter = end;
        }
    }
    prefix = afterLetter - at;
    figures = end - afterLetter;
    // What stands before a blank is all prefix.
    if (end < text.size() && isBlank(text[end])) {
        prefix = end - at;
        figures = 0;
    }
}

bool label::Reader::inkNumber(label& read) {
    size_t prefix = 0;
    size_t figures = 0;
    inkPrefixLength(prefix, figures);
    if (prefix > 3) {
        return fail("a prefix has at most three letters and digits");
    }
    if (figures > 5) {
        return fail("where the prefix ends and the feet begin cannot be told; put a blank between them");
    }
    for (size_t i = 0; i < prefix; ++i) {
        read.m_prefix[i] = upper(text[at++]);
    }
    read.m_prefixLength = static_cast<uint8_t>(prefix);
    read.m_spaced = isBlank(next());
    skipBlanks();
    int64_t feet = 0;
    const size_t length = digits(5, feet);
    if (length < 4) {
        return fail("four or five digits of feet are expected");
    }
    read.m_digits = static_cast<uint8_t>(length);
    return frameOf(read, feet) && end();
}

Qx::Status label::parse(std::string_view text, const Scale& scale, label& read) {
    if (!scale.valid()) {
        return Qx::Status::failure("no label can be read without knowing its frame rate or film gauge");
    }
    Reader reader(text);
    label made;
    made.m_scale = scale;
    const char* kind = "timecode";
    switch (scale.type) {
    case kTimecodeLabelType:
        static_cast<void>(reader.timecode(made));
        break;
    case kKeyKodeLabelType:
        kind = "key number";
        static_cast<void>(reader.keyNumber(made));
        break;
    case kFootFrameLabelType:
        kind = "length in feet and frames";
        static_cast<void>(reader.feetAndFrames(made));
        break;
    default:
        kind = "ink number";
        static_cast<void>(reader.inkNumber(made));
        break;
    }
    Qx::Status status = reader.status(kind);
    if (status) {
        read = made;
    }
    return status;
}
