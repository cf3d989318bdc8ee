#pragma once

#include "platform/base/qx_string.h"

#include <string>
#include <string_view>
#include <vector>

struct CommandOption;

/// How standard output shows a text, and the ways that qmedit writes: results to standard output, everything
/// else to standard error.
class Console {
public:
    /// Roles of a text in colour. `None` ends a colour.
    enum class Ink {
        None,
        Dim,
        Bold,
        Error,
        Warning,
        Video,
        VideoOther,
        Audio,
        AudioOther,
        Effect,
        Black,
        Cue
    };

    /// What a user asked for, whatever standard output is.
    struct Wish {
        std::string colour; ///< "always", "never"; else "auto"
        std::string width;  ///< columns as digits; empty for those that standard output has

        /// The options that set them, for the commands that draw.
        [[nodiscard]] std::vector<CommandOption> options();
    };

    /// What standard output can show: colours on a terminal unless NO_COLOR is set or TERM is "dumb"; UTF-8
    /// by LC_ALL, LC_CTYPE or LANG, the first that is set; the width by COLUMNS, else by the terminal of
    /// standard output or, as behind a pager, of standard error or input, else 100.
    [[nodiscard]] static Console forStandardOutput();
    [[nodiscard]] static Console forStandardOutput(const Wish& wish);
    /// True if standard error is a terminal, where progress can be shown as it goes.
    [[nodiscard]] static bool errorsToTerminal();
    /// A console of given abilities.
    Console(bool colour, bool utf8, int width, bool fitted)
        : m_colour(colour), m_utf8(utf8), m_fitted(fitted), m_width(width) {}

    [[nodiscard]] bool colour() const { return m_colour; }
    [[nodiscard]] bool utf8() const { return m_utf8; }
    /// True where lines are cut at the width, as somebody looks at them: on a terminal, or where a width or
    /// colours were asked for. Otherwise names stay whole, for the programs that read them.
    [[nodiscard]] bool fitted() const { return m_fitted; }
    /// Columns, 30 to 500.
    [[nodiscard]] int width() const { return m_width; }
    /// The sign, one column wide, that something was cut off.
    [[nodiscard]] const char* ellipsis() const { return m_utf8 ? "…" : "~"; }

    /// `text` made fit for this console (see `safe_text::escaped`).
    [[nodiscard]] String safe(std::string_view text) const;
    /// `text`, which is fit to be shown, in a colour; as it is without colours.
    [[nodiscard]] String inked(Ink ink, std::string_view text) const;
    /// The sequence that begins a colour, empty without colours.
    [[nodiscard]] const char* begin(Ink ink) const;

private:
    bool m_colour;
    bool m_utf8;
    bool m_fitted;
    int m_width;
};

/// Writes to standard output. A failure is remembered; see `finishOutput`.
void writeOut(std::string_view text);
/// What the command did, in one line, for `finishOutput` where more than a line is written of it.
void setOutcome(String line);
/// Flushes standard output. False, with one line on standard error, if anything could not be written. The
/// line says so when edits were `changed` all the same, with the line that was to tell of it.
[[nodiscard]] bool finishOutput(bool changed = false);

/// One line on standard error, "qmedit: " and the text, made fit for a terminal; wrapped where it goes to one.
void reportError(std::string_view text);
/// One line on standard error, "qmedit: warning: " and the text.
void reportWarning(std::string_view text);
/// One line on standard error, as it is but made fit for a terminal.
void reportProgress(std::string_view text);

/// Asks a question on the terminal and waits for the answer: true for "y" or "yes". True without asking where
/// standard input or standard error is no terminal.
[[nodiscard]] bool confirmed(std::string_view question);

/// Shows how far a long work is on the terminal's last line, over what was shown there before; an empty text
/// clears the line. Does nothing where standard error is no terminal.
void showProgress(std::string_view text);

/// Keeps the library's log off standard output. With QMEDIT_LOG set it goes to standard error, made fit for a
/// terminal; without, it is dropped: what a user is to know is reported by the command.
void routeLibraryLog();
