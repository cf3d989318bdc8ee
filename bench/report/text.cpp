#include "bench/report/text.h"

#include <algorithm>
#include <array>
#include <charconv>

namespace report {

std::string threeDigits(double value) {
    int decimals = 0;
    // From half a digit below a power of ten the rounded number has a digit more before the point.
    for (double bound = 99.95; value < bound && decimals < 6; bound /= 10) {
        ++decimals;
    }
    std::array<char, 64> buffer{};
    const bool huge = value >= 1e6;
    const auto written =
        std::to_chars(buffer.data(), buffer.data() + buffer.size(), value,
                      huge ? std::chars_format::scientific : std::chars_format::fixed, huge ? 2 : decimals);
    return {buffer.data(), written.ptr};
}

std::string numberText(double value) {
    std::array<char, 400> buffer{}; // the smallest number has 342 characters
    const auto written =
        std::to_chars(buffer.data(), buffer.data() + buffer.size(), value, std::chars_format::fixed);
    return {buffer.data(), written.ptr};
}

std::string timeText(double nanoseconds) {
    const struct {
        const char* name;
        double nanoseconds;
    } units[] = {{" ns", 1}, {" µs", 1e3}, {" ms", 1e6}};
    for (const auto& unit : units) {
        // From half a digit below 1000 the rounded number would have four digits.
        if (nanoseconds < 999.5 * unit.nanoseconds) {
            return threeDigits(nanoseconds / unit.nanoseconds) + unit.name;
        }
    }
    return threeDigits(nanoseconds / 1e9) + " s";
}

std::string countText(uint64_t count) {
    std::string text = std::to_string(count);
    for (size_t at = text.size(); at > 3;) {
        at -= 3;
        text.insert(at, " ");
    }
    return text;
}

std::string plain(std::string_view text, size_t most) {
    std::string out(text.substr(0, most));
    std::replace_if(
        out.begin(), out.end(), [](char c) { return c < ' ' || c > '~'; }, '?');
    return text.size() > most ? out + "..." : out;
}

std::string xmlText(std::string_view text) {
    std::string out;
    for (const char c : text) {
        switch (c) {
        case '&':
            out += "&amp;";
            break;
        case '<':
            out += "&lt;";
            break;
        case '>':
            out += "&gt;";
            break;
        case '"':
            out += "&quot;";
            break;
        default:
            out += c;
        }
    }
    return out;
}

size_t columns(std::string_view utf8) {
    const auto continues = [](char c) { return (static_cast<unsigned char>(c) & 0xC0u) == 0x80u; };
    return utf8.size() - static_cast<size_t>(std::count_if(utf8.begin(), utf8.end(), continues));
}

std::string padded(std::string_view utf8, size_t width, bool right) {
    const size_t used = columns(utf8);
    const std::string blanks(used < width ? width - used : 0, ' ');
    return right ? blanks + std::string(utf8) : std::string(utf8) + blanks;
}

std::string wrapped(std::string_view lead, std::string_view words, size_t width) {
    const std::string indent(columns(lead), ' ');
    std::string out;
    std::string line(lead);
    bool begun = false;
    while (!words.empty()) {
        const size_t end = std::min(words.find(' '), words.size());
        const std::string_view word = words.substr(0, end);
        words.remove_prefix(std::min(end + 1, words.size()));
        if (begun && columns(line) + 1 + columns(word) > width) {
            out += line + "\n";
            line = indent;
            begun = false;
        }
        line += (begun ? " " : "") + std::string(word);
        begun = true;
    }
    return out + line + "\n";
}

} // namespace report
