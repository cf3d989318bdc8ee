#include "tools/qmedit/console.h"

#include "platform/services/log.h"
#include "tools/qmedit/command_line.h"
#include "tools/qmedit/safe_text.h"

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <sys/ioctl.h>
#include <unistd.h>

namespace {

constexpr int kDefaultWidth = 100;
constexpr int kLeastWidth = 30;
constexpr int kGreatestWidth = 500;

int outputError = 0;
String lastLine; ///< what was written last, if it is one line
String outcome;  ///< what the command did, where its output is more than a line

const char* environment(const char* name) {
    const char* value = std::getenv(name);
    return value != nullptr && *value != '\0' ? value : nullptr;
}

bool localeIsUtf8() {
    for (const char* name : {"LC_ALL", "LC_CTYPE", "LANG"}) {
        if (const char* value = environment(name)) {
            const String lower = String(value).lower();
            return lower.find("utf-8") != String::npos || lower.find("utf8") != String::npos;
        }
    }
    return false;
}

/// Columns of the terminal behind a descriptor; 0 where there is none.
int columnsOf(int descriptor) {
    winsize size{};
    return ioctl(descriptor, TIOCGWINSZ, &size) == 0 ? int{size.ws_col} : 0;
}

int widthOf(const std::string& wished) {
    const char* const columns = environment("COLUMNS");
    for (const std::string& text : {wished, std::string(columns != nullptr ? columns : "")}) {
        int width = 0;
        if (Qx::textToInt(text, width) && width > 0) {
            return std::clamp(width, kLeastWidth, kGreatestWidth);
        }
    }
    // A pager shows standard output on the terminal that the other streams still have.
    for (const int stream : {STDOUT_FILENO, STDERR_FILENO, STDIN_FILENO}) {
        if (const int width = columnsOf(stream); width > 0) {
            return std::clamp(width, kLeastWidth, kGreatestWidth);
        }
    }
    return kDefaultWidth;
}

String checkWidth(const std::string& text) {
    int width = 0;
    if (Qx::textToInt(text, width) && width >= kLeastWidth && width <= kGreatestWidth) {
        return {};
    }
    return String::format("'%s' is no width; give a number of columns from %d to %d", text.c_str(),
                          kLeastWidth, kGreatestWidth);
}

bool errorsAscii() {
    static const bool ascii = !localeIsUtf8();
    return ascii;
}

void errorLine(std::string_view lead, std::string_view text) {
    String line = String(lead) + safe_text::escaped(text, errorsAscii());
    if (const int width = columnsOf(STDERR_FILENO); width > 0 && !lead.empty()) {
        constexpr int kIndent = 4;
        line = safe_text::wrapped(line, std::clamp(width, kLeastWidth, kGreatestWidth), 0, kIndent);
    }
    line += "\n";
    std::fwrite(line.data(), 1, line.size(), stderr);
}

} // namespace

Console Console::forStandardOutput() {
    return forStandardOutput(Wish());
}

Console Console::forStandardOutput(const Wish& wish) {
    const bool terminal = isatty(STDOUT_FILENO) == 1;
    const char* term = environment("TERM");
    const bool dumb = term == nullptr || std::strcmp(term, "dumb") == 0;
    const bool always = wish.colour == "always";
    const bool automatic = !always && wish.colour != "never";
    return {always || (automatic && terminal && !dumb && environment("NO_COLOR") == nullptr), localeIsUtf8(),
            widthOf(wish.width), terminal || always || !wish.width.empty()};
}

std::vector<CommandOption> Console::Wish::options() {
    return {{.name = "--width",
             .value = &width,
             .help = "Columns to draw in (else $COLUMNS, else the terminal's, else 100)",
             .form = "N",
             .check = checkWidth},
            {.name = "--colour",
             .value = &colour,
             .help = "Colours: auto (on a terminal), always, never",
             .form = "WHEN",
             .choices = {"auto", "always", "never"}}};
}

bool Console::errorsToTerminal() {
    return isatty(STDERR_FILENO) == 1;
}

String Console::safe(std::string_view text) const {
    return safe_text::escaped(text, !m_utf8);
}

const char* Console::begin(Ink ink) const {
    if (!m_colour) {
        return "";
    }
    switch (ink) {
    case Ink::None:
        return "\x1b[0m";
    case Ink::Dim:
        return "\x1b[2m";
    case Ink::Bold:
        return "\x1b[1m";
    case Ink::Error:
        return "\x1b[1;38;5;231;48;5;124m";
    case Ink::Warning:
        return "\x1b[1;38;5;208m";
    case Ink::Video:
        return "\x1b[38;5;231;48;5;25m";
    case Ink::VideoOther:
        return "\x1b[38;5;231;48;5;31m";
    case Ink::Audio:
        return "\x1b[38;5;231;48;5;28m";
    case Ink::AudioOther:
        return "\x1b[38;5;231;48;5;22m";
    case Ink::Effect:
        return "\x1b[38;5;231;48;5;90m";
    case Ink::Black:
        return "\x1b[38;5;250;48;5;235m";
    case Ink::Cue:
        return "\x1b[1;38;5;214m";
    }
    return "";
}

String Console::inked(Ink ink, std::string_view text) const {
    if (!m_colour || ink == Ink::None || text.empty()) {
        return String(text);
    }
    return String(begin(ink)) + String(text) + begin(Ink::None);
}

void writeOut(std::string_view text) {
    const bool isLine = !text.empty() && text.find('\n') == text.size() - 1;
    lastLine = isLine ? String(text.substr(0, text.size() - 1)) : String();
    errno = 0;
    if (outputError == 0 && std::fwrite(text.data(), 1, text.size(), stdout) != text.size()) {
        outputError = errno != 0 ? errno : EIO;
    }
}

void setOutcome(String line) {
    outcome = std::move(line);
}

bool finishOutput(bool changed) {
    errno = 0;
    if (std::fflush(stdout) != 0 && outputError == 0) {
        outputError = errno != 0 ? errno : EIO;
    }
    if (outputError == 0) {
        return true;
    }
    reportError(String("cannot write standard output: ") + std::strerror(outputError) +
                (changed ? "; the command was carried out all the same" : "") +
                (changed && !(outcome + lastLine).empty() ? ": " + (outcome.empty() ? lastLine : outcome)
                                                          : String()));
    return false;
}

void reportError(std::string_view text) {
    errorLine("qmedit: ", text);
}

void reportWarning(std::string_view text) {
    errorLine("qmedit: warning: ", text);
}

void reportProgress(std::string_view text) {
    errorLine("", text);
}

bool confirmed(std::string_view question) {
    if (isatty(STDIN_FILENO) != 1 || !Console::errorsToTerminal()) {
        return true;
    }
    const String line = safe_text::escaped(question, errorsAscii()) + " [y/N] ";
    std::fwrite(line.data(), 1, line.size(), stderr);
    std::fflush(stdout);
    char text[16] = {};
    if (std::fgets(text, sizeof text, stdin) == nullptr) {
        return false;
    }
    const String answer = String(text).trimmed().lower();
    return answer == "y" || answer == "yes";
}

void showProgress(std::string_view text) {
    static int shown = 0;
    if (!Console::errorsToTerminal()) {
        return;
    }
    const String line = safe_text::escaped(text, errorsAscii());
    const int columns = safe_text::columns(line);
    const String padding(static_cast<size_t>(std::max(shown - columns, 0)), ' ');
    const String whole = "\r" + line + padding + (line.empty() ? "\r" : "");
    std::fwrite(whole.data(), 1, whole.size(), stderr);
    shown = columns;
}

void routeLibraryLog() {
    const bool wanted = environment("QMEDIT_LOG") != nullptr;
    Qx::setLogSink([wanted](std::string_view line) {
        if (!wanted) {
            return;
        }
        while (!line.empty() && (line.back() == '\n' || line.back() == ' ')) {
            line.remove_suffix(1);
        }
        reportProgress(line);
    });
    Qx::setStandardOutputSink([](std::string_view) {});
}
